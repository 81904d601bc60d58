#include "layers/etcd/detail/LastKnown.hpp"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <boost/crc.hpp>

#include <cerrno>
#include <charconv>
#include <fstream>
#include <iterator>
#include <stdexcept>
#include <string_view>
#include <system_error>

#include "layers/detail/ValueCodec.hpp"

namespace velkor::layers::etcd {

namespace fs = std::filesystem;

namespace {

constexpr std::string_view mark = "velkor-etcd 1\n";

[[noreturn]] void fail(const fs::path& file, const std::string& reason) {
    throw std::runtime_error(file.string() + ": " + reason);
}

[[noreturn]] void failBySystem(const fs::path& file) {
    fail(file, std::generic_category().message(errno));
}

std::uint32_t checksumOf(std::string_view content) {
    boost::crc_32_type sum;
    sum.process_bytes(content.data(), content.size());
    return sum.checksum();
}

// Each part stands behind the count of its bytes and ":", with "\n" behind it.
void append(std::string& target, std::string_view part) {
    target += std::to_string(part.size());
    target += ':';
    target += part;
    target += '\n';
}

class PartReader {
public:
    explicit PartReader(std::string_view text) : rest(text) {}

    bool isAtEnd() const { return rest.empty(); }

    std::string_view part() {
        const auto size = static_cast<std::size_t>(numberUntil(rest.find(':')));
        if (size >= rest.size() || rest[size] != '\n') throw std::runtime_error("it is damaged");
        const std::string_view content = rest.substr(0, size);
        rest.remove_prefix(size + 1);
        return content;
    }

    std::int64_t number() {
        PartReader digits(part());
        return digits.numberUntil(digits.rest.size());
    }

private:
    std::int64_t numberUntil(std::size_t end) {
        std::int64_t content = -1;
        if (end <= rest.size()) {
            const char* const last = rest.data() + end;
            const auto read = std::from_chars(rest.data(), last, content);
            if (read.ec != std::errc() || read.ptr != last) content = -1;
        }
        if (content < 0) throw std::runtime_error("it is damaged");
        rest.remove_prefix(end == rest.size() ? end : end + 1);
        return content;
    }

    std::string_view rest;
};

std::string textOf(const std::string& prefix, const LastKnown& content) {
    std::string text;
    append(text, prefix);
    append(text, content.position.cluster);
    append(text, std::to_string(content.position.revision));
    append(text, content.position.witness);
    append(text, std::to_string(content.position.witnessModified));
    for (const auto& [key, value] : content.values) {
        append(text, key);
        append(text, layers::detail::encoded(value));
    }
    std::string sum;
    append(sum, std::to_string(checksumOf(text)));
    return std::string(mark) + sum + text;
}

LastKnown parse(std::string_view text, const std::string& prefix) {
    if (text.substr(0, mark.size()) != mark) throw std::runtime_error("it is of another program");
    text.remove_prefix(mark.size());
    PartReader head(text);
    const std::int64_t sum = head.number();
    std::string sumText;
    append(sumText, std::to_string(sum));
    text.remove_prefix(sumText.size());
    if (sum != checksumOf(text)) throw std::runtime_error("it is damaged");
    PartReader reader(text);
    if (reader.part() != prefix) throw std::runtime_error("it is of another prefix");
    LastKnown content;
    content.position.cluster = reader.part();
    content.position.revision = reader.number();
    content.position.witness = reader.part();
    content.position.witnessModified = reader.number();
    while (!reader.isAtEnd()) {
        const std::string_view key = reader.part();
        auto value = layers::detail::decoded(reader.part());
        if (!value) throw std::runtime_error("it is of a newer version");
        content.values.emplace(key, std::move(*value));
    }
    return content;
}

/// A new file for its owner alone.
class NewFile {
public:
    explicit NewFile(const fs::path& where) : path(where), descriptor(create(path)) {
        if (descriptor < 0) failBySystem(path);
    }
    ~NewFile() {
        ::close(descriptor);
        if (!isInPlace) ::unlink(path.c_str());
    }
    NewFile(const NewFile&) = delete;
    NewFile& operator=(const NewFile&) = delete;

    void write(std::string_view content) const {
        while (!content.empty()) {
            const auto written = ::write(descriptor, content.data(), content.size());
            if (written < 0 && errno == EINTR) continue;
            if (written < 0) failBySystem(path);
            content.remove_prefix(static_cast<std::size_t>(written));
        }
        if (::fsync(descriptor) != 0) failBySystem(path);
    }

    void replace(const fs::path& file) {
        if (::rename(path.c_str(), file.c_str()) != 0) failBySystem(file);
        isInPlace = true;
    }

private:
    // What stands there may be readable for others, or lead elsewhere.
    static int create(const fs::path& path) {
        ::unlink(path.c_str());
        return ::open(path.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_CLOEXEC, 0600);
    }

    const fs::path& path;
    const int descriptor;
    bool isInPlace = false;
};

}  // namespace

void writeLastKnown(const fs::path& file, const std::string& prefix, const LastKnown& content) {
    fs::path beside = file;
    beside += ".new";
    NewFile replacement(beside);
    replacement.write(textOf(prefix, content));
    replacement.replace(file);
}

LastKnown readLastKnown(const fs::path& file, const std::string& prefix) {
    // Some of what is no file would never end, or wait for somebody who writes.
    std::error_code unknown;
    const fs::file_status status = fs::status(file, unknown);
    if (fs::exists(status) && !fs::is_regular_file(status)) fail(file, "it is no file");
    errno = 0;
    std::ifstream in(file, std::ios::binary);
    if (!in) failBySystem(file);
    const std::string text{std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>()};
    try {
        return parse(text, prefix);
    } catch (const std::runtime_error& problem) {
        fail(file, problem.what());
    }
}

}  // namespace velkor::layers::etcd
