#include "tests/stress/histories/StoreRound.hpp"

namespace velkor::testing {

namespace {

using Kind = StoreCall::Kind;

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

    StoreCall::Change change(const std::vector<std::string>& keys,
                             const std::vector<std::string>& names) {
        StoreCall::Change chosen{among(keys), std::nullopt, maybe(names)};
        if (!oneIn(3)) chosen.value = newValue();
        return chosen;
    }

    ModelLayer layer(const std::string& name) {
        static const std::vector<std::string> groups{"", "g."};
        static const std::vector<int> orders{-2, -1, 5, 5, 6};
        ModelLayer chosen{name, among(groups), among(orders), oneIn(3), {}};
        for (const char* const key : {"a", "b"}) {
            if (!oneIn(3)) chosen.values[key] = newValue();
        }
        return chosen;
    }

private:
    std::mt19937& random;
    int& value;
};

const std::vector<std::string> allKeys{"a", "b", "g.a", "g.b"};
const std::vector<std::string> allNames{"override", "default", "one", "two"};

StoreCall callOfOneKey(Chooser& choose) {
    static const std::vector<std::string> keys{"a", "b"};
    static const std::vector<std::string> names{"override", "default", "none"};
    static const std::vector<Kind> kinds{Kind::get,   Kind::has, Kind::getOption, Kind::explain,
                                         Kind::unset, Kind::set, Kind::set,       Kind::set};
    StoreCall call{choose.among(kinds)};
    call.key = choose.among(keys);
    if (StoreModel::isRead(call)) return call;
    call.source = choose.maybe(names);
    if (call.kind == Kind::set) call.value = choose.newValue();
    return call;
}

StoreCall anyCall(Chooser& choose) {
    static const std::vector<Kind> kinds{
        Kind::get,      Kind::has,    Kind::getOption, Kind::keys, Kind::keysFrom, Kind::explain,
        Kind::describe, Kind::dryRun, Kind::read,      Kind::read, Kind::set,      Kind::set,
        Kind::set,      Kind::unset,  Kind::apply,     Kind::add,  Kind::add,      Kind::remove};
    StoreCall call{choose.among(kinds)};
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
                call.changes.push_back(choose.change(allKeys, allNames));
            }
            break;
        case Kind::add:
            call.layer = choose.layer(choose.among(allNames));
            break;
        case Kind::remove:
            call.source = choose.among(allNames);
            break;
        default: {
            const auto change = choose.change(allKeys, allNames);
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
