#include "benchmarks/fleet/Promises.hpp"

#include <map>
#include <utility>

#include "benchmarks/fleet/Host.hpp"

namespace velkor::benchmarks {

namespace {

// "process 3: setting.5 = 30000004".
std::string text(const HostProcess& host, const Note& note) {
    return "process " + std::to_string(host.number()) + ": " + settingName(note.key) + " = " +
           std::to_string(note.value);
}

/// What the notes of all processes are held against.
struct Comparison {
    Promise invented{"no value was shown that was never written"};
    Promise backwards{"no setting went back to an older revision"};
    Promise lost{"no acknowledged write is lost"};
    Promise disordered{"acknowledged writes of a process stand in their order"};
    Promise made{"no write that was refused was made"};
    Promise unread{"each writer's store showed its write at once"};
    Promise overflown{"all was noted"};

    void compare(const HostProcess& host, const History& history);

private:
    void onShown(const HostProcess& host, const Note& note, const History& history,
                 std::map<int, std::size_t>& newest);
    void onReadBack(const HostProcess& host, const Note& note, const Note& own,
                    const History& history);
};

void Comparison::compare(const HostProcess& host, const History& history) {
    std::map<int, std::size_t> newest;  // by setting
    std::size_t lastTaken = 0;
    Note own{};
    for (const Note& note : host.notes()) {
        const auto place = history.place(note.key, note.value);
        switch (note.what) {
            case What::shown:
                onShown(host, note, history, newest);
                break;
            case What::taken:
                if (!place) lost.broken.push_back(text(host, note));
                if (place && *place < lastTaken) disordered.broken.push_back(text(host, note));
                lastTaken = place.value_or(lastTaken);
                break;
            case What::refused:
                if (place) made.broken.push_back(text(host, note));
                break;
            case What::sent:
                own = note;
                break;
            case What::readBack:
                onReadBack(host, note, own, history);
                break;
            case What::unknown:
                break;
        }
    }
    if (host.notes().hasOverflown()) {
        overflown.broken.push_back("process " + std::to_string(host.number()));
    }
}

// A process shows its own writes before they are made, and some never are: then the value before
// comes again.
void Comparison::onShown(const HostProcess& host, const Note& note, const History& history,
                         std::map<int, std::size_t>& newest) {
    if (writerOf(note.value) == host.number()) return;
    const auto place = history.place(note.key, note.value);
    if (!place) return invented.broken.push_back(text(host, note));
    const auto [entry, isFirst] = newest.try_emplace(note.key, *place);
    if (isFirst) return;
    if (*place < entry->second) backwards.broken.push_back(text(host, note));
    entry->second = *place;
}

// What another has written since may be there already.
void Comparison::onReadBack(const HostProcess& host, const Note& note, const Note& own,
                            const History& history) {
    const auto ownPlace = history.place(own.key, own.value);
    const auto place = history.place(note.key, note.value);
    if (ownPlace && place && *place > *ownPlace) return;
    unread.broken.push_back(text(host, note));
}

}  // namespace

std::vector<Promise> comparePromises(const HostProcesses& hosts, const History& history) {
    Comparison all;
    for (const auto& host : hosts) all.compare(*host, history);
    Promise once{"no write was made twice"};
    for (const int value : history.repeated()) once.broken.push_back(std::to_string(value));
    return {all.invented, all.backwards, all.lost,   all.disordered,
            all.made,     once,          all.unread, all.overflown};
}

}  // namespace velkor::benchmarks
