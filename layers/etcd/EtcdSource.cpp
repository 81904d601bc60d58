#include "layers/etcd/EtcdSource.hpp"

#include <stdexcept>
#include <utility>

#include "layers/etcd/detail/Core.hpp"
#include "layers/etcd/detail/Follower.hpp"
#include "layers/etcd/detail/Sender.hpp"
#include "layers/etcd/detail/ValueText.hpp"

namespace velkor::layers {

using configuration::ConfigurationValue;
using configuration::ValueMap;
using configuration::ValueTable;
using etcd::Core;
using etcd::Outbox;

std::shared_ptr<EtcdSource> EtcdSource::open(const std::vector<std::string>& endpoints,
                                             const std::string& prefix, EtcdOptions options) {
    auto core = std::make_shared<Core>(etcd::toEndpoints(endpoints), prefix, std::move(options));
    auto source = std::make_shared<EtcdSource>(Key(), core);
    core->changeTable = [weak = std::weak_ptr(source)](const Core::Mutation& mutation) {
        const OwnThread::Borrowing waitedFor;
        const auto alive = weak.lock();
        if (alive) alive->change(mutation);
        return alive != nullptr;
    };
    source->start();
    // The last reference of others waits for the threads, which refer to the source themselves.
    return {source.get(), [source](EtcdSource*) mutable {
                source->finish();
                source.reset();
            }};
}

EtcdSource::EtcdSource(Key, std::shared_ptr<Core> shared)
    : LiveSource(typeid(EtcdSource), ValueMap(), Code::own), core(std::move(shared)) {}

EtcdSource::~EtcdSource() {
    finish();
}

void EtcdSource::start() {
    const auto firstValues = std::make_shared<etcd::Start>();
    reader.emplace([job = std::make_unique<etcd::Follower>(core, firstValues)] { job->run(); });
    const std::string problem = firstValues->await();
    if (!problem.empty()) throw std::runtime_error(etcd_errors::notStarted + problem);
    writer.emplace([job = std::make_unique<etcd::Sender>(core)] { job->run(); });
}

void EtcdSource::finish() {
    core->stop.request();
    core->outbox.end();
    reader.reset();
    writer.reset();
}

void EtcdSource::requireRoom(const Core& core) {
    if (core.outbox.hasRoom()) return;
    throw std::runtime_error(std::string(etcd_errors::notWritten) + etcd_errors::tooManyWaiting);
}

ConfigurationValue EtcdSource::set(const std::string& key, ConfigurationValue value) {
    requireRoom(*core);
    auto write = Outbox::prepare({key, etcd::toValueText(value)});
    ConfigurationValue answer;
    change([&](ValueTable& table) {
        const ConfigurationValue* const present = table.find(key);
        answer = present == nullptr ? value : *present;
        Keys changed{key};
        write.front().writes.front().seen = core->replica.seen(table, key);
        core->replica.write(table, key, std::move(value));
        core->outbox.accept(std::move(write));
        return changed;
    });
    return answer;
}

std::optional<ConfigurationValue> EtcdSource::unset(const std::string& key) {
    requireRoom(*core);
    auto write = Outbox::prepare({key, std::nullopt});
    std::optional<ConfigurationValue> removed;
    change([&](ValueTable& table) {
        const ConfigurationValue* const present = table.find(key);
        if (present == nullptr) return Keys();
        removed = *present;
        Keys changed{key};
        write.front().writes.front().seen = core->replica.seen(table, key);
        core->replica.write(table, key, std::nullopt);
        core->outbox.accept(std::move(write));
        return changed;
    });
    return removed;
}

Future<bool> EtcdSource::committed() {
    return core->outbox.committed();
}

void EtcdSource::beginGroup() {
    core->outbox.beginGroup();
}

void EtcdSource::endGroup() noexcept {
    core->outbox.endGroup();
}

configuration::SourceState EtcdSource::state() const {
    auto state = core->standing.state();
    const std::size_t waiting = core->outbox.count();
    if (waiting > 0) state.details.emplace_back("waiting writes", std::to_string(waiting));
    return state;
}

}  // namespace velkor::layers
