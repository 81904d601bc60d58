#include "layers/files/ReloadingFileSource.hpp"

#include <filesystem>
#include <memory>
#include <optional>
#include <string>

#include "layers/testing/SourceContract.hpp"
#include "tests/layers/contract/PropertyText.hpp"
#include "tests/support/TemporaryFile.hpp"

namespace velkor::layers {
namespace {

using configuration::ConfigurationSource;
using configuration::ConfigurationValue;
using configuration::ValueMap;
using namespace layers::testing;

class ReloadingFile : public ChangingSubject {
public:
    std::shared_ptr<ConfigurationSource> make(const ValueMap& values) override {
        held = values;
        file.rewrite(text());
        return std::make_shared<ReloadingFileSource>(file.path());
    }

    void change(const std::string& key, const std::optional<ConfigurationValue>& value) override {
        held.erase(key);
        if (value) held[key] = *value;
        const velkor::testing::TemporaryFile next(text());
        std::filesystem::rename(next.path(), file.path());
    }

    bool isWritable() const override { return false; }

    bool canHold(const ConfigurationValue& value) const override {
        return boost::get<std::string>(&value) != nullptr;
    }

private:
    // An empty file would count as one that can't be read.
    std::string text() const { return "# held\n" + propertyText(held); }

    ValueMap held;
    const velkor::testing::TemporaryFile file{""};
};

VELKOR_SOURCE_CONTRACT(ReloadingFileSource, ReloadingFile);

}  // namespace
}  // namespace velkor::layers
