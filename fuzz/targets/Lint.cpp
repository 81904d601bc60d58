// What is remarked upon in any bytes as a property file.

#include <string>
#include <string_view>

#include "configuration/sources/PropertyFileLint.hpp"
#include "fuzz/Finding.hpp"
#include "fuzz/Targets.hpp"

namespace velkor::fuzz {
namespace {

using configuration::PropertyRemark;
using configuration::PropertyText;

// What is remarked upon lies in the file, and comes in the order of its places.
void checkRemarksOn(std::string_view input) {
    std::size_t line = 1;
    std::size_t column = 1;
    configuration::lintProperties(PropertyText{input}, [&](const PropertyRemark& remark) {
        const bool inOrder = remark.line > line || (remark.line == line && remark.column >= column);
        expectThat(inOrder, "Remarks come in order",
                   std::to_string(remark.line) + ":" + std::to_string(remark.column));
        expectThat(remark.line <= input.size() + 1 && remark.column <= input.size() + 1,
                   "A remark is about a place in the file", std::to_string(remark.line));
        expectThat(remark.firstLine <= remark.line, "The first line of a key comes first",
                   std::to_string(remark.firstLine));
        line = remark.line;
        column = remark.column;
    });
}

const Target target("lint", checkRemarksOn);

}  // namespace
}  // namespace velkor::fuzz
