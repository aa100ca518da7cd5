#include "view/show/html_page.hpp"

#include <string_view>

#include "view/show/page_template.hpp"

namespace view {

namespace {

constexpr std::string_view kDocumentMark = "/*DOCUMENT*/";

// JSON that cannot end the script element it stands in.
std::string forScript(const nlohmann::ordered_json& document) {
    const std::string json = document.dump();
    std::string safe;
    safe.reserve(json.size());
    for (const char c : json) {
        if (c == '<') {
            safe += "\\u003c";
        } else {
            safe += c;
        }
    }
    return safe;
}

} // namespace

void writePage(std::ostream& output, const nlohmann::ordered_json& document) {
    const std::size_t mark = kPageTemplate.find(kDocumentMark);
    output << kPageTemplate.substr(0, mark) << forScript(document)
           << kPageTemplate.substr(mark + kDocumentMark.size());
}

} // namespace view
