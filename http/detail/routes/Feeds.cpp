#include "http/detail/routes/Feeds.hpp"

#include <cstddef>
#include <cstdint>
#include <exception>
#include <new>
#include <optional>
#include <utility>
#include <vector>

#include "http/detail/routes/ChangeHub.hpp"
#include "http/detail/routes/Items.hpp"
#include "http/detail/routes/JsonWriter.hpp"
#include "http/detail/routes/Mailbox.hpp"
#include "http/detail/routes/PendingChanges.hpp"
#include "settings/Secrets.hpp"

namespace velkor::http::detail {

namespace {

using configuration::ConfigurationImpl;
using configuration::ConfigurationValue;
using configuration::OptionChange;

// Of a client that is slower than that the stream ends: it begins again, and reads all there is.
constexpr std::size_t mostPendingKeys = 1000;

std::string eventText(std::uint64_t id, const std::string& json) {
    return "id: " + std::to_string(id) + "\ndata: " + json + "\n\n";
}

class WatchFeed final : public EventFeed {
public:
    WatchFeed(const std::shared_ptr<ConfigurationImpl>& watched, const std::string& watchedKey,
              std::shared_ptr<Metrics> counts)
        : store(watched),
          keys{watchedKey},
          metrics(std::move(counts)),
          publisher(watched->watchOption(watchedKey)) {
        ++metrics->watchesOpen;
    }

    ~WatchFeed() override {
        --metrics->watchesOpen;
        try {
            // A watch that has had no subscriber would stay: only one can cancel it.
            if (mailbox == nullptr) subscribe([] {});
            mailbox->cancel();
        } catch (...) {
            return;  // the watch ends with the store
        }
    }

    WatchFeed(const WatchFeed&) = delete;
    WatchFeed& operator=(const WatchFeed&) = delete;

    void start(std::function<void()> onReady) override { subscribe(std::move(onReady)); }

    std::optional<std::string> next() override {
        auto value = mailbox->take();
        metrics->valuesConflated += mailbox->takeConflated();
        if (!value) return std::nullopt;
        ++metrics->valuesDelivered;
        return eventText(++lastId, json(*std::move(value)));
    }

    bool isOver() const override { return mailbox->isOver(); }

private:
    void subscribe(std::function<void()> onReady) {
        mailbox = std::make_shared<Mailbox<ConfigurationValue>>(std::move(onReady));
        std::exchange(publisher, nullptr)->subscribe(mailbox);
    }

    std::string json(ConfigurationValue&& delivered) const {
        const auto alive = store.lock();
        const bool hidden = alive == nullptr || settings::isSecret(alive, keys.front());
        JsonWriter writer;
        writer.value(newest(alive, std::move(delivered)), hidden);
        return writer.take();
    }

    // Of two threads that deliver at the same time the one with the older value may be the last.
    ConfigurationValue newest(const std::shared_ptr<ConfigurationImpl>& alive,
                              ConfigurationValue&& delivered) const {
        if (alive == nullptr) return std::move(delivered);
        try {
            auto option = std::move(alive->read(keys).get().options.front());
            if (option) return std::move(option->value);
        } catch (const std::bad_alloc&) {
            throw;
        } catch (const std::exception&) {
            return std::move(delivered);  // a source that can't be read now could be then
        }
        return std::move(delivered);
    }

    const std::weak_ptr<ConfigurationImpl> store;
    const std::vector<std::string> keys;  // the one
    const std::shared_ptr<Metrics> metrics;
    std::shared_ptr<reactive_streams::PublisherAPI<ConfigurationValue>> publisher;
    std::shared_ptr<Mailbox<ConfigurationValue>> mailbox;
    std::uint64_t lastId = 0;
};

class ChangeFeed final : public EventFeed {
public:
    ChangeFeed(const std::shared_ptr<ConfigurationImpl>& watched, const std::string& prefix,
               std::shared_ptr<ChangeHub> changeHub, std::shared_ptr<Metrics> counts)
        : store(watched),
          hub(std::move(changeHub)),
          metrics(std::move(counts)),
          changes(std::make_shared<PendingChanges>(prefix, mostPendingKeys)) {
        hub->join(*watched, changes);
        ++metrics->changeStreamsOpen;
    }

    ~ChangeFeed() override {
        --metrics->changeStreamsOpen;
        changes->abandon();
        try {
            hub->leave(changes);
        } catch (...) {
            return;  // it is left out when the next change comes
        }
    }

    ChangeFeed(const ChangeFeed&) = delete;
    ChangeFeed& operator=(const ChangeFeed&) = delete;

    void start(std::function<void()> onReady) override { changes->start(std::move(onReady)); }

    std::optional<std::string> next() override {
        const SharedChange change = changes->take();
        metrics->valuesConflated += changes->takeConflated();
        if (change == nullptr) return std::nullopt;
        ++metrics->valuesDelivered;
        return eventText(++lastId, json(*change));
    }

    bool isOver() const override { return changes->isOver(); }

private:
    std::string json(const OptionChange& change) const {
        const auto alive = store.lock();
        const bool hidden = alive == nullptr || settings::isSecret(alive, change.key);
        JsonWriter writer;
        writer.beginObject();
        writeKey(writer, change.key);
        if (change.option) {
            writer.name("value").value(change.option->value, hidden);
            writer.member("source", change.option->source);
        } else {
            writer.member("gone", true);
        }
        writer.endObject();
        return writer.take();
    }

    const std::weak_ptr<ConfigurationImpl> store;
    const std::shared_ptr<ChangeHub> hub;
    const std::shared_ptr<Metrics> metrics;
    const std::shared_ptr<PendingChanges> changes;
    std::uint64_t lastId = 0;
};

}  // namespace

std::unique_ptr<EventFeed> watchFeed(const std::shared_ptr<ConfigurationImpl>& store,
                                     const std::string& key, std::shared_ptr<Metrics> metrics) {
    return std::make_unique<WatchFeed>(store, key, std::move(metrics));
}

std::unique_ptr<EventFeed> changeFeed(const std::shared_ptr<ConfigurationImpl>& store,
                                      const std::string& prefix,
                                      const std::shared_ptr<ChangeHub>& hub,
                                      std::shared_ptr<Metrics> metrics) {
    return std::make_unique<ChangeFeed>(store, prefix, hub, std::move(metrics));
}

}  // namespace velkor::http::detail
