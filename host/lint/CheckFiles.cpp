#include "host/lint/CheckFiles.hpp"

#include <stdexcept>

#include "host/lint/Remarks.hpp"
#include "host/sources/PropertyFile.hpp"

namespace velkor::host {

namespace {

std::size_t check(const std::string& path, const std::string& text, CommandOutput& output) {
    std::size_t count = 0;
    configuration::lintProperties({text}, [&](const configuration::PropertyRemark& remark) {
        ++count;
        output.line(remarkText(path, remark));
    });
    return count;
}

}  // namespace

CheckedFiles checkFiles(const std::vector<std::string>& paths, const SourceLimits& limits,
                        CommandOutput& output) {
    CheckedFiles checked;
    for (const auto& path : paths) {
        std::string text;
        try {
            text = readPropertyFile(path, limits);
        } catch (const std::runtime_error& error) {
            ++checked.unreadable;
            output.note(error.what());
            continue;
        }
        checked.remarks += check(path, text, output);
    }
    return checked;
}

}  // namespace velkor::host
