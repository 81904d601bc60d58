#pragma once

#include <optional>
#include <set>
#include <string>

#include "configuration/sources/ConfigurationSource.hpp"
#include "configuration/sources/ForgettingSource.hpp"
#include "configuration/sources/ValueTable.hpp"
#include "fuzz/store/System.hpp"

namespace velkor::fuzz::store {

/// A source of another library: throws, acts on the store while it is written, and may be
/// registered several times.
class OwnSource final : public configuration::ConfigurationSource,
                        public configuration::ForgettingSource {
public:
    using Value = configuration::ConfigurationValue;

    OwnSource(System& itsSystem, std::size_t itsNumber) : system(itsSystem), number(itsNumber) {}

    Value get(const std::string& key) override;
    Value set(const std::string& key, Value value) override;
    bool has(const std::string& key) override;
    void setChangeListener(configuration::ChangeListener newListener) override;
    std::set<std::string> keys() override;
    std::optional<Value> unset(const std::string& key) override;

    Temper temper{};

private:
    void changed(const std::string& key);

    System& system;
    const std::size_t number;
    configuration::ValueTable values{{}};
    configuration::ChangeListener listener{};
};

}  // namespace velkor::fuzz::store
