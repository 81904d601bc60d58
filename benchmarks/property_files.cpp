// Reading a property file.

#include <Poco/AutoPtr.h>
#include <Poco/Util/PropertyFileConfiguration.h>

#include <filesystem>
#include <fstream>
#include <memory>
#include <stdexcept>
#include <string>
#include <utility>

#include "benchmarks/support/FloorParser.hpp"
#include "benchmarks/support/Harness.hpp"
#include "benchmarks/support/PropertyText.hpp"
#include "configuration/sources/PropertyFileSource.hpp"
#include "tests/support/TemporaryFile.hpp"

namespace velkor::benchmarks {

namespace {

using configuration::PropertyFileSource;
using testing::TemporaryFile;
using File = std::shared_ptr<const TemporaryFile>;

ValueMap readFloor(const TemporaryFile& file) {
    std::ifstream stream(file.path(), std::ios::binary);
    std::string text(std::filesystem::file_size(file.path()), '\0');
    stream.read(text.data(), static_cast<std::streamsize>(text.size()));
    return floorParse(text);
}

// The floor would be none if it left anything out.
void requireSameProperties(const TemporaryFile& file) {
    const ValueMap expected = readFloor(file);
    PropertyFileSource source(file.widePath());
    bool same = source.keys().size() == expected.size();
    for (const auto& [key, value] : expected) same = same && source.get(key) == value;
    if (!same) throw std::logic_error("the floor parser reads something else");
}

// Reads a file of `entries` with the function `read`.
template <class Read>
void measureRead(const std::string& name, std::size_t entries, Read read) {
    measure(name,
            [entries, read] {
                auto file = std::make_shared<TemporaryFile>(propertyText(entries));
                requireSameProperties(*file);
                return [file, read] { read(*file); };
            })
        .perItemOf(entries)
        .counted(entries > 100'000 ? 0 : 2);
}

void measureFile(const std::string& size, std::size_t entries) {
    const std::string name = "property-file/" + size + "/";
    measureRead(name + "floor", entries, [](const TemporaryFile& file) { keep(readFloor(file)); });
    measureRead(name + "velkor", entries, [](const TemporaryFile& file) {
        keep(std::make_shared<PropertyFileSource>(file.widePath()));
    });
    measureRead(name + "poco", entries, [](const TemporaryFile& file) {
        keep(Poco::AutoPtr<Poco::Util::PropertyFileConfiguration>(
            new Poco::Util::PropertyFileConfiguration(file.path().string())));
    });
}

}  // namespace

void addOperations() {
    measureFile("100KB", 2'270);
    measureFile("10MB", 221'000);
}

}  // namespace velkor::benchmarks
