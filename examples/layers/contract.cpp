#include "layers/testing/SourceContract.hpp"

#include "configuration/sources/TableSource.hpp"

using namespace velkor::configuration;
using namespace velkor::layers::testing;

// A layer that takes texts only.
class TextSource final : public TableSource {
public:
    explicit TextSource(ValueMap texts) : TableSource(typeid(TextSource), std::move(texts)) {}

    ConfigurationValue set(const std::string& key, ConfigurationValue value) override {
        boost::get<std::string>(value);  // throws when it is none
        ConfigurationValue answer = values.take(key).value_or(value);
        values.insert(key, std::move(value));
        notify(key);
        return answer;
    }
};

// What the contract has to know of it.
class Texts : public SourceSubject {
public:
    std::shared_ptr<ConfigurationSource> make(const ValueMap& values) override {
        return std::make_shared<TextSource>(values);
    }

    bool canHold(const ConfigurationValue& value) const override {
        return value.type() == typeid(std::string);
    }
};

VELKOR_SOURCE_CONTRACT(TextSource, Texts);
