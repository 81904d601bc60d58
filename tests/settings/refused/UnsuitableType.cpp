#include <chrono>
#include <optional>
#include <string>
#include <vector>

#include "settings/Conversion.hpp"

enum class Unnamed { one };

#ifdef MISTAKE_PUT_RIGHT
using Wanted = std::vector<std::optional<int>>;
#else
using Wanted = UNSUITABLE;
#endif

std::string name() {
    return velkor::settings::Conversion<Wanted>::typeName();
}
