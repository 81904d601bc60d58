#include "framework/RoutingErrors.hpp"

namespace velkor {

std::string typeName(const std::type_info& type) {
    const char* name = type.name();
    return *name == '*' ? name + 1 : name;
}

}  // namespace velkor
