// Reading a property file, and what is read of it.

#include <Poco/AutoPtr.h>
#include <Poco/Util/PropertyFileConfiguration.h>
#include <glib.h>

#include <filesystem>
#include <fstream>
#include <memory>
#include <stdexcept>
#include <string>
#include <utility>

#include "benchmarks/support/FloorParser.hpp"
#include "benchmarks/support/FloorStore.hpp"
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

void readKeyFile(const TemporaryFile& file) {
    const std::unique_ptr<GKeyFile, decltype(&g_key_file_unref)> keys(g_key_file_new(),
                                                                      g_key_file_unref);
    if (!g_key_file_load_from_file(keys.get(), file.path().c_str(), G_KEY_FILE_NONE, nullptr)) {
        throw std::runtime_error("GLib refuses its file");
    }
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
    measure(name + "key-file",
            [entries] {
                return [file = std::make_shared<TemporaryFile>(keyFileText(entries))] {
                    readKeyFile(*file);
                };
            })
        .perItemOf(entries)
        .counted(0);
}

Store storeOf(const std::string& text) {
    Store store = emptyStore();
    store->addSource("only", "", 0, true,
                     std::make_shared<PropertyFileSource>(configuration::PropertyText{text}));
    return store;
}

// Looks `count` keys up in turn in what `hold` makes of their text; of a million so many different
// ones that they don't stay in the caches.
template <class Hold>
void measureGet(const std::string& contender, std::size_t count, Hold hold) {
    const bool large = count > 100'000;
    measure("property-file/get/keys:" + std::to_string(count) + "/" + contender, [count, large,
                                                                                  hold] {
        return [held = hold(propertyText(count)),
                keys = KeyCycle(count, large ? 16'384 : 256)]() mutable {
            keep(held->get(keys.next()).get());
        };
    }).counted(large ? 0 : 1024);
}

std::shared_ptr<FloorStore> floorOf(const std::string& text) {
    return std::make_shared<FloorStore>(floorParse(text));
}

// Weighs what `hold` makes of a text, for each key.
template <class Hold>
void weigh(const std::string& contender, Hold hold) {
    constexpr std::size_t count = 100'000;
    measure("property-file/memory/" + contender,
            [hold] {
                using Held = decltype(hold(std::string()));
                return [text = propertyText(count), hold, held = Held()]() mutable {
                    held = hold(text);
                };
            })
        .perItemOf(count)
        .weighsHeap();
}

}  // namespace

void addOperations() {
    measureFile("100KB", 2'270);
    measureFile("10MB", 221'000);
    for (const std::size_t count : {std::size_t{10}, std::size_t{10'000}, std::size_t{1'000'000}}) {
        measureGet("floor", count, floorOf);
        measureGet("velkor", count, storeOf);
    }
    weigh("floor", floorOf);
    weigh("velkor", storeOf);
}

}  // namespace velkor::benchmarks
