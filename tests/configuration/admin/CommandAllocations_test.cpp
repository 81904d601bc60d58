#include <gtest/gtest.h>

#include <cstddef>
#include <memory>
#include <new>
#include <set>
#include <string>

#include "configuration/ConfigurationImpl.hpp"
#include "configuration/admin/ConfigurationCommandProvider.hpp"
#include "tests/support/AllocationCounter.hpp"

namespace velkor::configuration {
namespace {

using testing::AllocationFailure;

// A registry whose own allocations fail as well: inside a registration, and after it.
class SetAdministration : public administration::Administration {
public:
    Future<bool> registerCommand(administration::CommandDescriptor command) override {
        names.insert(command.name);
        return makeReadyFuture(true);
    }

    Future<bool> unregisterCommand(const std::string& name) override {
        names.erase(name);
        return makeReadyFuture(true);
    }

    std::set<std::string> names;
};

TEST(CommandAllocations, NoneThatFailsInTheConstructorLeavesACommandRegistered) {
    const auto store = std::make_shared<ConfigurationImpl>();
    const auto registry = std::make_shared<SetAdministration>();
    std::unique_ptr<ConfigurationCommandProvider> provider;
    std::size_t failures = 0;
    while (provider == nullptr) {
        try {
            const AllocationFailure failure(failures);
            provider = std::make_unique<ConfigurationCommandProvider>(store, registry);
            EXPECT_FALSE(failure.hasHappened());
        } catch (const std::bad_alloc&) {
            ++failures;
            EXPECT_EQ(registry->names, std::set<std::string>());
        }
    }
    const std::size_t commandCount = 3;
    EXPECT_GT(failures, commandCount);
    EXPECT_EQ(registry->names.size(), commandCount);
}

}  // namespace
}  // namespace velkor::configuration
