#include "tests/stress/histories/StoreRound.hpp"

namespace velkor::testing {

namespace {

using Kind = StoreCall::Kind;

// Made before the threads, which only read them.
const std::vector<std::string> allKeys{"a", "b", "g.a", "g.b"};
const std::vector<std::string> allNames{"override", "default", "one", "two"};
const std::vector<std::string> allGroups{"", "g."};
const std::vector<int> allOrders{-2, -1, 5, 5, 6};
const std::vector<Kind> allKinds{
    Kind::get,      Kind::has,    Kind::getOption, Kind::keys, Kind::keysFrom, Kind::explain,
    Kind::describe, Kind::dryRun, Kind::read,      Kind::read, Kind::set,      Kind::set,
    Kind::set,      Kind::unset,  Kind::apply,     Kind::add,  Kind::add,      Kind::remove};

const std::vector<std::string> singleKeys{"a", "b"};
const std::vector<std::string> fixedNames{"override", "default", "none"};
const std::vector<Kind> kindsOfOneKey{Kind::get,   Kind::has, Kind::getOption, Kind::explain,
                                      Kind::unset, Kind::set, Kind::set,       Kind::set};

/// Chooses what a call is about.
class Chooser {
public:
    Chooser(std::mt19937& numbers, int& lastValue) : random(numbers), value(lastValue) {}

    std::size_t below(std::size_t bound) { return random() % bound; }
    bool oneIn(std::size_t times) { return below(times) == 0; }
    int newValue() { return ++value; }

    template <class T>
    const T& among(const std::vector<T>& all) {
        return all[below(all.size())];
    }

    std::optional<std::string> maybe(const std::vector<std::string>& names) {
        if (oneIn(2)) return std::nullopt;
        return among(names);
    }

    StoreCall::Change change() {
        StoreCall::Change chosen{among(allKeys), std::nullopt, maybe(allNames)};
        if (!oneIn(3)) chosen.value = newValue();
        return chosen;
    }

    ModelLayer layer(const std::string& name) {
        ModelLayer chosen{name, among(allGroups), among(allOrders), oneIn(3), {}};
        for (const char* const key : {"a", "b"}) {
            if (!oneIn(3)) chosen.values[key] = newValue();
        }
        return chosen;
    }

private:
    std::mt19937& random;
    int& value;
};

StoreCall callOfOneKey(Chooser& choose) {
    StoreCall call{choose.among(kindsOfOneKey)};
    call.key = choose.among(singleKeys);
    if (StoreModel::isRead(call)) return call;
    call.source = choose.maybe(fixedNames);
    if (call.kind == Kind::set) call.value = choose.newValue();
    return call;
}

StoreCall anyCall(Chooser& choose) {
    StoreCall call{choose.among(allKinds)};
    switch (call.kind) {
        case Kind::keys:
        case Kind::describe:
            break;
        case Kind::read:
            call.keys = allKeys;
            break;
        case Kind::dryRun:
        case Kind::apply:
            for (std::size_t i = 0; i < 3; ++i) {
                call.changes.push_back(choose.change());
            }
            break;
        case Kind::add:
            call.layer = choose.layer(choose.among(allNames));
            break;
        case Kind::remove:
            call.source = choose.among(allNames);
            break;
        default: {
            const auto change = choose.change();
            call.key = change.key;
            if (call.kind == Kind::set || call.kind == Kind::unset) call.source = change.source;
            if (call.kind == Kind::set) call.value = choose.newValue();
        }
    }
    return call;
}

}  // namespace

StoreCall randomCall(std::mt19937& random, bool everything, int& lastValue) {
    Chooser choose(random, lastValue);
    return everything ? anyCall(choose) : callOfOneKey(choose);
}

}  // namespace velkor::testing
