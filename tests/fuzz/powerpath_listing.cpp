// The PowerPath listing, cut into lines from reads of any sizes and paired. The input is four bytes for the
// sizes of the reads, which take turns (0: as much as there is room for), and then the listing.
#include <vector>

#include "multipath/powerpath.hpp"
#include "tests/fuzz/harness.hpp"

namespace {

using Handler = ZebSensorLinuxPowerPathHandler;

// Feeds the listing through sBreakOutput as sExecuteCommand does, in reads of the given sizes.
Handler::LineList::List linesOf(std::string_view listing, const std::vector<uint8>& sizes) {
    Handler::LineList::List lines;
    std::vector<char> buffer(Handler::kOutputSize);
    char* const end = buffer.data() + buffer.size();
    char* position = buffer.data();
    for (std::size_t read = 0; !listing.empty(); ++read) {
        std::fill(position, end, '\0');
        const auto room = static_cast<std::size_t>(end - position) - 1;
        const std::size_t wanted = sizes[read % sizes.size()];
        const std::size_t count = std::min({listing.size(), room, wanted != 0 ? wanted : room});
        if (count == 0) {
            break; // a line that fills the buffer ends the reading
        }
        std::copy_n(listing.data(), count, position);
        listing.remove_prefix(count);
        position = Handler::sBreakOutput(buffer.data(), lines);
        require(position >= buffer.data() && position < end, "a read position outside the buffer");
    }
    return lines;
}

// The lines that any sizes must give: those that end, up to the first that does not fit.
std::vector<std::string> expectedLines(std::string_view listing) {
    std::vector<std::string> lines;
    for (std::size_t end = listing.find('\n'); end != std::string_view::npos; end = listing.find('\n')) {
        if (end >= Handler::kOutputSize - 1) {
            break;
        }
        lines.emplace_back(listing.substr(0, end));
        listing.remove_prefix(end + 1);
    }
    return lines;
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8* data, std::size_t size) {
    Input input(data, size);
    const std::vector<uint8> sizes = {input.byte(), input.byte(), input.byte(), input.byte()};
    const std::string listing(input.rest());
    const std::string daemons = "1 emcpd\n2 emcpd\n";

    Handler::LineList::List lines;
    runInput({}, [&] { lines = linesOf(listing, sizes); });
    if (listing.find('\0') == std::string::npos) {
        const std::vector<std::string> expected = expectedLines(listing);
        require(lines.size() == expected.size(), "lines lost or made up");
        auto line = lines.begin();
        for (const std::string& text : expected) {
            require(*line++ == text.c_str(), "a line that is not the listing's");
        }
    }
    // A line without "=" is fatal. Fewer than two lines are not parsed.
    runInput({"lPos != ZebString::npos"}, [&] {
        if (lines.size() >= 2) {
            Handler handler;
            handler.__parse(lines);
            require(lines.empty(), "lines left over");
        }
    });
    gHost.command = [&](const std::string& command) {
        return command.find("pgrep") != std::string::npos ? &daemons : &listing;
    };
    runInput({"lPos != ZebString::npos"}, [&] {
        Handler handler;
        handler.sense();
        if (handler.isRunning()) {
            handler.printData();
        }
    });
    return 0;
}
