#include "host/console/LineHistory.hpp"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <array>
#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <stdexcept>
#include <string_view>
#include <system_error>
#include <utility>

namespace velkor::host {

namespace {

namespace fs = std::filesystem;

constexpr mode_t privateFolder = 0700;
constexpr mode_t privateFile = 0600;

/// A private file that is open; closed with this. No link is followed to it: it would lead to a
/// file that is somebody else's.
class OpenHistory {
public:
    OpenHistory(const fs::path& path, int mode)
        : descriptor(::open(path.c_str(),
                            mode | O_CREAT | O_CLOEXEC | O_NOCTTY | O_NONBLOCK | O_NOFOLLOW,
                            privateFile)) {}
    ~OpenHistory() {
        if (isOpen()) ::close(descriptor);
    }

    OpenHistory(const OpenHistory&) = delete;
    OpenHistory& operator=(const OpenHistory&) = delete;

    bool isOpen() const noexcept { return descriptor >= 0; }

    /// Keeps others from reading it. What is no file, such as /dev/null, stays as it is, and so
    /// does a file that has another name, for which it was made.
    void makePrivate() const noexcept {
        struct stat status {};
        const bool isOurs =
            ::fstat(descriptor, &status) == 0 && S_ISREG(status.st_mode) && status.st_nlink == 1;
        if (isOurs) ::fchmod(descriptor, privateFile);
    }

    std::string content() const {
        std::string text;
        std::array<char, 65536> block{};
        ssize_t count = 0;
        while ((count = ::read(descriptor, block.data(), block.size())) > 0) {
            text.append(block.data(), static_cast<std::size_t>(count));
        }
        return text;
    }

    bool write(std::string_view text) const noexcept {
        return ::write(descriptor, text.data(), text.size()) == static_cast<ssize_t>(text.size());
    }

private:
    const int descriptor;
};

// A folder that can't be made shows when the file is opened.
void makeFolders(const fs::path& folder) {
    fs::path current;
    for (const auto& part : folder) {
        current /= part;
        ::mkdir(current.c_str(), privateFolder);
    }
}

std::vector<std::string> splitLines(std::string_view text) {
    std::vector<std::string> lines;
    while (!text.empty()) {
        const std::size_t end = text.find('\n');
        if (end != 0) lines.emplace_back(text.substr(0, end));
        if (end == std::string_view::npos) break;
        text.remove_prefix(end + 1);
    }
    return lines;
}

std::optional<fs::path> folderFrom(const char* variable) {
    const char* const value = std::getenv(variable);
    const fs::path folder(value == nullptr ? "" : value);
    if (!folder.is_absolute()) return std::nullopt;
    return folder;
}

}  // namespace

LineHistory::LineHistory(fs::path historyFile) : file(std::move(historyFile)) {
    makeFolders(file.parent_path());
    const OpenHistory history(file, O_RDWR);
    if (!history.isOpen()) {
        throw std::runtime_error("History can't be kept: " + file.string() + ": " +
                                 std::system_category().message(errno));
    }
    history.makePrivate();
    lines = splitLines(history.content());
    if (lines.size() <= mostLines) return;
    lines.erase(lines.begin(), lines.end() - mostLines);
    cut();
}

void LineHistory::add(const std::string& line) const {
    const OpenHistory history(file, O_WRONLY | O_APPEND);
    if (history.isOpen()) history.write(line + '\n');
}

// In one step, so that no session finds half of the lines.
void LineHistory::cut() const {
    std::string text;
    for (const auto& line : lines) text += line + '\n';
    const fs::path shorter = file.string() + '.' + std::to_string(::getpid());
    const OpenHistory history(shorter, O_WRONLY | O_TRUNC);
    if (!history.isOpen()) return;
    const bool isReplaced = history.write(text) && std::rename(shorter.c_str(), file.c_str()) == 0;
    if (!isReplaced) ::unlink(shorter.c_str());
}

std::optional<fs::path> usualHistoryFile() {
    if (const auto state = folderFrom("XDG_STATE_HOME")) return *state / "velkor" / "history";
    const auto home = folderFrom("HOME");
    std::error_code unknown;
    if (!home || !fs::is_directory(*home, unknown)) return std::nullopt;
    return *home / ".local" / "state" / "velkor" / "history";
}

}  // namespace velkor::host
