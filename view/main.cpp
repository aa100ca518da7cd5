#include <exception>
#include <iostream>

#include "view/commands.hpp"
#include "view/trouble.hpp"

int main(int argc, char** argv) {
    try {
        std::ios::sync_with_stdio(false);
        const int status = view::runCommandLine(argc, argv);
        std::cout.flush();
        if (!std::cout) {
            throw view::Trouble("standard output: the report could not be written");
        }
        return status;
    } catch (const std::exception& error) {
        std::cerr << "morvane-view: " << error.what() << '\n';
    }
    return view::kExitTrouble;
}
