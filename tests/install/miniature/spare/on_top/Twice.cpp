#include "spare/on_top/Twice.hpp"

#include "spare/Product.hpp"

int velkor::twice() {
    return 2 * product();
}
