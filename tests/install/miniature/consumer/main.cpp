#include <iostream>

#ifdef WITH_SPARE
#include "spare/Product.hpp"
#else
#include "framework/Number.hpp"
#endif

int main() {
#ifdef WITH_SPARE
    std::cout << velkor::product() << '\n';
#else
    std::cout << velkor::number() << '\n';
#endif
}
