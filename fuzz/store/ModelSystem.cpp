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
    watches.end();
    changeWatches.end();
}

std::string ModelSystem::carryOut(const Step& step) {
    if (watches.isMeant(step)) return watches.carryOut(step);
    if (changeWatches.isMeant(step)) return changeWatches.carryOut(step);
    switch (step.operation) {
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
        case 'n':
            return store->read(step.keys);
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
        case 'W':
            return changeWatches.begin(step, [&] { return store->watchChanges(step.key); });
        default:
            return watches.begin(step, [&] { return store->watch(step.key); });
    }
}

}  // namespace velkor::fuzz::store
