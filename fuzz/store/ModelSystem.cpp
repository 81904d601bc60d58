#include "fuzz/store/ModelSystem.hpp"

#include "fuzz/Values.hpp"

namespace velkor::fuzz::store {

ModelSystem::ModelSystem()
    : store(std::make_shared<ModelStore>(
          [this](const std::string& message) {
              if (isRecording()) record(message);
          },
          [this](const std::string& line) { note(line); })) {
    for (std::size_t i = 0; i < ownSources; ++i) {
        own.push_back(std::make_shared<ModelSource>(*this, i));
    }
}

void ModelSystem::end() {
    store.reset();
    for (std::size_t i = 0; i < watches.size(); ++i) watches[i].held.reset();
}

std::string ModelSystem::carryOut(const Step& step) {
    switch (step.operation) {
        case 'b':
        case 'q':
        case 'x':
        case 'v':
            return onWatch(step);
        case 't':
            own[step.number]->temper = {step.mood, step.reaction};
            return "";
        case 'l':
            startRecording(step);
            return "";
        case 'D':
            store.reset();
            return "";
        default:
            return hasStore() ? onStore(step) : "no store";
    }
}

std::string ModelSystem::onStore(const Step& step) {
    switch (step.operation) {
        case 'g':
            return store->get(step.key);
        case 'o':
            return store->option(step.key);
        case 'h':
            return store->has(step.key);
        case 'e':
            return store->explain(step.key);
        case 'k':
            return store->keys();
        case 'f':
            return store->keysFrom(step.key);
        case 'd':
            return store->describe();
        case 's':
            return store->set(step, nullptr);
        case 'S':
            return store->set(step, &step.name);
        case 'u':
            return store->unset(step, nullptr);
        case 'U':
            return store->unset(step, &step.name);
        case 'a':
            return store->apply(step.changes, step.flag);
        case 'm':
        case 'p':
            return store->add(step,
                              std::make_shared<ModelSource>(step.values, step.operation == 'p'));
        case 'c':
            return store->add(step, own[step.number]);
        case 'r':
            return store->remove(step.name);
        case 'i':
            return exactly(own[step.number]->set(step.key, step.value));
        default:
            return watch(step);
    }
}

std::string ModelSystem::watch(const Step& step) {
    const std::size_t number = watches.size();
    watches.emplace_back();
    const auto publisher = store->watch(step.key);
    if (step.flag) watches[number].held = publisher;
    subscribe(*publisher, number, step);
    return "";
}

void ModelSystem::subscribe(ModelPublisher& publisher, std::size_t number, const Step& step) {
    publisher.subscribe(std::make_shared<Watcher>(*this, number, step, [this, number](auto opened) {
        watches[number].subscription = std::move(opened);
    }));
}

std::string ModelSystem::onWatch(const Step& step) {
    if (watches.empty()) return "no watch";
    const std::size_t number = step.number % watches.size();
    if (step.operation == 'v') {
        const auto givenUp = std::move(watches[number].held);
        return "";
    }
    if (step.operation == 'b') {
        const auto publisher = watches[number].held;
        if (publisher) subscribe(*publisher, number, step);
        return "";
    }
    const auto subscription = watches[number].subscription.lock();
    if (subscription == nullptr) return "";
    if (step.operation == 'q') {
        subscription->request(step.demand);
    } else {
        subscription->cancel();
    }
    return "";
}

}  // namespace velkor::fuzz::store
