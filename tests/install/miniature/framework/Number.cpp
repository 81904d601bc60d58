#include "framework/Number.hpp"

int velkor::number() {
    return 6;
}
