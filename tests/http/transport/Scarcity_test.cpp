#include <gtest/gtest.h>
#include <sys/resource.h>

#include <fcntl.h>

#include <string>
#include <vector>

#include "http/detail/Descriptor.hpp"
#include "tests/http/transport/ListenerTesting.hpp"

namespace velkor::http::detail::transport {
namespace {

using velkor::testing::HttpClient;

// Takes all descriptors that the process has left, few of which it has while this lives.
class NoDescriptors {
public:
    NoDescriptors() {
        ::getrlimit(RLIMIT_NOFILE, &before);
        constexpr rlim_t few = 256;
        const rlimit now{few, before.rlim_max};
        ::setrlimit(RLIMIT_NOFILE, &now);
        for (;;) {
            Descriptor next(::open("/dev/null", O_RDONLY | O_CLOEXEC));
            if (!next) break;
            taken.push_back(std::move(next));
        }
    }
    ~NoDescriptors() { ::setrlimit(RLIMIT_NOFILE, &before); }

    NoDescriptors(const NoDescriptors&) = delete;
    NoDescriptors& operator=(const NoDescriptors&) = delete;

    void giveOneBack() { taken.pop_back(); }

private:
    rlimit before{};
    std::vector<Descriptor> taken;
};

TEST(Scarcity, OfDescriptorsLetsClientsWaitUntilThereIsOne) {
    const Serving serving;
    HttpClient present(serving.port());
    EXPECT_EQ(present.ask("GET /").status, 200);
    NoDescriptors none;
    none.giveOneBack();
    HttpClient waiting(serving.port());
    waiting.send("GET /waited HTTP/1.1\r\n\r\n");
    EXPECT_EQ(present.ask("GET /").status, 200);
    EXPECT_EQ(serving.counts->connectionsAccepted, 1U);
    none.giveOneBack();
    EXPECT_EQ(waiting.answer().body, "GET /waited ");
}

TEST(Scarcity, OfDescriptorsDoesNotKeepTheServerFromStopping) {
    const Serving serving;
    NoDescriptors none;
    none.giveOneBack();
    HttpClient waiting(serving.port());
    EXPECT_TRUE(velkor::testing::completes([&] { serving.listener->stop(); }));
}

}  // namespace
}  // namespace velkor::http::detail::transport
