#include "fuzz/store/OwnSource.hpp"

#include <utility>

namespace velkor::fuzz::store {

OwnSource::Value OwnSource::get(const std::string& key) {
    temper.require(Mood::refusesGet);
    return values.at(key);
}

OwnSource::Value OwnSource::set(const std::string& key, Value value) {
    temper.require(Mood::refusesSet);
    const std::string keptKey = key;  // the caller's may go while the store is acted upon
    Value answer = value;
    if (Value* const present = values.find(key)) {
        answer = std::exchange(*present, std::move(value));
    } else {
        values.insert(key, std::move(value));
    }
    changed(keptKey);
    return answer;
}

bool OwnSource::has(const std::string& key) {
    temper.require(Mood::refusesHas);
    return values.find(key) != nullptr;
}

void OwnSource::setChangeListener(configuration::ChangeListener newListener) {
    system.note("source " + std::to_string(number) + (newListener ? " listened to" : " left"));
    listener.swap(newListener);
}

std::set<std::string> OwnSource::keys() {
    temper.require(Mood::refusesKeys);
    return values.keys();
}

std::optional<OwnSource::Value> OwnSource::unset(const std::string& key) {
    temper.require(Mood::refusesSet);
    const std::string keptKey = key;
    auto removed = values.take(key);
    if (removed) changed(keptKey);
    return removed;
}

void OwnSource::changed(const std::string& key) {
    temper.react(system);
    temper.require(Mood::failsAfterSet);
    // Beyond the store's life a source that was removed from it must not call it.
    if (!system.hasStore()) return;
    const auto told = listener;  // which may be replaced while it runs
    if (told) told(key);
}

}  // namespace velkor::fuzz::store
