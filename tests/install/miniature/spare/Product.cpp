#include "spare/Product.hpp"

int velkor::product() {
    return number() * IMAGINARY_UNIT;
}
