#include "fuzz/Targets.hpp"

namespace velkor::fuzz {

Target::Target(std::string_view targetName, Check targetCheck)
    : ownName(targetName), check(targetCheck) {
    targets().push_back(this);
}

std::vector<const Target*>& targets() {
    static std::vector<const Target*> known;
    return known;
}

}  // namespace velkor::fuzz
