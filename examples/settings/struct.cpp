#include <iostream>
#include <memory>

#include "settings/Bound.hpp"

using namespace velkor::settings;
using velkor::configuration::ConfigurationValue;

struct Pool {
    int least = 0;
    int most = 0;
};

int main() {
    const auto store = std::make_shared<velkor::configuration::ConfigurationImpl>();
    const Bound<Pool> pool(
        store, "pool", fields(&Pool::least, "least", 2, atLeast(0), &Pool::most, "most", 8),
        [](const Pool& all) { return all.least > all.most ? "least is above most" : ""; });

    // Both at once: nobody sees one without the other.
    store->apply({{"pool.least", ConfigurationValue(10)}, {"pool.most", ConfigurationValue(20)}});
    std::cout << pool.snapshot()->least << " to " << pool.snapshot()->most << '\n';

    store->set("pool.most", 5);
    std::cout << pool.snapshot()->least << " to " << pool.snapshot()->most << ", since "
              << pool.status().error.value_or("all is well") << '\n';
}
