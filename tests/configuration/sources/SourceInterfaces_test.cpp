// What a source may implement beside `ConfigurationSource`.

#include <gtest/gtest.h>

#include <cstddef>
#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "configuration/sources/DurableSource.hpp"
#include "configuration/sources/JournaledSource.hpp"

namespace velkor::configuration {
namespace {

// What each source that has gone was.
using Gone = std::shared_ptr<std::string>;

class Durable final : public DurableSource {
public:
    explicit Durable(Gone where) : gone(std::move(where)) {}
    ~Durable() override { *gone += "durable "; }
    Future<bool> committed() override { return makeReadyFuture(true); }

private:
    const Gone gone;
};

class Journaled final : public JournaledSource {
public:
    explicit Journaled(Gone where) : gone(std::move(where)) {}
    ~Journaled() override { *gone += "journaled "; }
    std::vector<RecordedChange> changes(const std::string&, std::size_t) override { return {}; }

private:
    const Gone gone;
};

TEST(SourceInterfaces, AreDestroyedAsWhatTheyAre) {
    const auto gone = std::make_shared<std::string>();
    std::unique_ptr<DurableSource>(std::make_unique<Durable>(gone)).reset();
    std::unique_ptr<JournaledSource>(std::make_unique<Journaled>(gone)).reset();
    EXPECT_EQ(*gone, "durable journaled ");
}

}  // namespace
}  // namespace velkor::configuration
