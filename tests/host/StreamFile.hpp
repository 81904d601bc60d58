#pragma once

#include <cstdio>
#include <memory>
#include <stdexcept>
#include <string>
#include <string_view>

namespace velkor::host {

/// A file without a name that serves as a standard stream of a child.
class StreamFile {
public:
    explicit StreamFile(std::string_view content = "") : file(std::tmpfile()) {
        if (!file) throw std::runtime_error("no temporary file");
        std::fwrite(content.data(), 1, content.size(), file.get());
        std::rewind(file.get());
    }

    int descriptor() const { return ::fileno(file.get()); }

    std::string content() const {
        std::string text;
        std::rewind(file.get());
        for (int byte = std::fgetc(file.get()); byte != EOF; byte = std::fgetc(file.get())) {
            text += static_cast<char>(byte);
        }
        return text;
    }

private:
    struct Closer {
        void operator()(std::FILE* stream) const { std::fclose(stream); }
    };
    std::unique_ptr<std::FILE, Closer> file;
};

}  // namespace velkor::host
