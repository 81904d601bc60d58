#pragma once

#include <gtest/gtest.h>

#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "configuration/ConfigurationImpl.hpp"
#include "tests/support/HookedSource.hpp"
#include "tests/support/ValueText.hpp"

namespace velkor::testing {

/// What the store's future throws, or "" when it throws nothing.
template <class T>
std::string failureOf(Future<T> future) {
    try {
        future.get();
    } catch (const std::exception& error) {
        return error.what();
    }
    return "";
}

/// A store and short ways to ask it.
class StoreTest : public ::testing::Test {
protected:
    std::string valueOf(const std::string& key) const { return textOf(store->get(key).get()); }

    std::string sourceOf(const std::string& key) const {
        return store->getOption(key).get().source;
    }

    /// Adds a table under `name`; expects that to succeed.
    void add(const std::string& name, const std::string& group, int order,
             configuration::ValueMap values, bool readOnly = false) const {
        EXPECT_TRUE(
            store->addInMemorySource(name, group, order, readOnly, std::move(values)).get());
    }

    /// Adds a hooked source under `name` and gives it back.
    std::shared_ptr<HookedSource> addHooked(const std::string& name, const std::string& group,
                                            int order, HookedSource::Table values = {},
                                            bool readOnly = false) const {
        auto source = std::make_shared<HookedSource>(std::move(values));
        EXPECT_TRUE(store->addSource(name, group, order, readOnly, source).get());
        source->calls.clear();
        return source;
    }

    /// The names of the sources in order of precedence.
    std::vector<std::string> names() const {
        std::vector<std::string> all;
        for (const auto& source : store->describeSources().get()) all.push_back(source.name);
        return all;
    }

    std::shared_ptr<configuration::ConfigurationImpl> store =
        std::make_shared<configuration::ConfigurationImpl>();
};

}  // namespace velkor::testing
