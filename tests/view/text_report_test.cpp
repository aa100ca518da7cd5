#include <sstream>
#include <string>

#include <gtest/gtest.h>

#include "view/show/text.hpp"

namespace {

TEST(TextReport, ShowsTheTargetsOfAPortThatIsListedTwiceOnce) {
    view::Model model;
    model.fc.state = view::TreeState::Built;
    view::Adapter adapter;
    adapter.state = view::AdapterState::Reported;
    adapter.initiators = {"10:01", "10:01"};
    model.fc.adapters = {adapter};
    for (const char* target : {"52:02", "52:01", "52:02"}) {
        view::FcPath path;
        path.initiator = "10:01";
        path.targetNode = "50:01";
        path.targetPort = target;
        model.fc.paths.push_back(path);
    }
    std::ostringstream output;
    view::writeText(output, model, view::Style::of(false));
    EXPECT_NE(output.str().find("    initiator 10:01\n"
                                "      target 52:02 of 50:01  2 LUNs\n"
                                "      target 52:01 of 50:01  1 LUN\n"
                                "    initiator 10:01\n"
                                "\n"),
              std::string::npos)
        << output.str();
}

} // namespace
