#include "host/console/ArgumentWords.hpp"

#include <algorithm>
#include <filesystem>
#include <initializer_list>
#include <system_error>
#include <utility>

#include "host/console/ValueWords.hpp"

namespace velkor::host {

namespace {

namespace fs = std::filesystem;
using Words = std::vector<std::string>;

constexpr char alternativeMark = '|';

bool isOneOf(std::string_view name, std::initializer_list<std::string_view> names) {
    return std::find(names.begin(), names.end(), name) != names.end();
}

Words filesAt(const std::string& typed) {
    const std::size_t slash = typed.rfind('/');
    const std::size_t nameStart = slash == std::string::npos ? 0 : slash + 1;
    const std::string folder = typed.substr(0, nameStart);
    const bool showsHidden = typed.size() > nameStart && typed[nameStart] == '.';
    Words files;
    std::error_code error;
    for (fs::directory_iterator entry(folder.empty() ? "." : folder, error), end;
         !error && entry != end; entry.increment(error)) {
        std::string name = entry->path().filename().string();
        if (name.front() == '.' && !showsHidden) continue;
        std::error_code unknown;
        if (entry->is_directory(unknown)) name += '/';
        files.push_back(folder + name);
    }
    std::sort(files.begin(), files.end());
    return files;
}

Words alternatives(std::string_view names) {
    Words words;
    for (;;) {
        const std::size_t end = names.find(alternativeMark);
        words.emplace_back(names.substr(0, end));
        if (end == std::string_view::npos) return words;
        names.remove_prefix(end + 1);
    }
}

}  // namespace

ArgumentWords::ArgumentWords(std::shared_ptr<SessionStore> sessionStore,
                             std::shared_ptr<const Watches> sessionWatches,
                             std::shared_ptr<const SessionSources> sessionSources)
    : store(std::move(sessionStore)),
      watches(std::move(sessionWatches)),
      sources(std::move(sessionSources)) {}

Words ArgumentWords::of(std::string_view name, const std::string& typed) const {
    if (isOneOf(name, {"KEY", "KEY-PREFIX", "PATTERN"})) {
        const auto keys = store->keys().get();
        return {keys.begin(), keys.end()};
    }
    if (name == "WATCHED-KEY") return watches->keys();
    if (isOneOf(name, {"SOURCE", "A", "B"})) return sources->names();
    if (name == "T") return typeNames();
    if (name == "FILE") return filesAt(typed);
    if (name.find(alternativeMark) != std::string_view::npos) return alternatives(name);
    return {};
}

}  // namespace velkor::host
