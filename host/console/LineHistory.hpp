#pragma once

#include <cstddef>
#include <filesystem>
#include <optional>
#include <string>
#include <vector>

namespace velkor::host {

/// Lines that were typed, kept in a file from one session to the next. Only its owner may read the
/// file, unless it has another name, and the folders that are made for it. A symbolic link in its
/// place is not followed. Several sessions may share it.
class LineHistory {
public:
    /// The number of lines that a session begins with; the file is cut to these then.
    static constexpr std::size_t mostLines = 1000;

    /// Reads the lines of `historyFile`, which is made when it is missing, with its folders. Throws
    /// `std::runtime_error` "History can't be kept: ", the path, ": " and the system's reason.
    explicit LineHistory(std::filesystem::path historyFile);

    /// What was there at the beginning, the oldest line first.
    const std::vector<std::string>& earlierLines() const noexcept { return lines; }

    /// Puts `line`, which holds no line feed, behind the others. One that can't be written is not
    /// kept.
    void add(const std::string& line) const;

private:
    void cut() const;

    const std::filesystem::path file;
    std::vector<std::string> lines;
};

/// Where a user's history is: velkor/history in the folder that XDG_STATE_HOME names by an absolute
/// path, or in .local/state in the home folder. Nothing where there is none.
std::optional<std::filesystem::path> usualHistoryFile();

}  // namespace velkor::host
