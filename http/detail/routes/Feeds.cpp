#include "http/detail/routes/Feeds.hpp"

#include <cstdint>
#include <exception>
#include <new>
#include <optional>
#include <utility>
#include <vector>

#include "http/detail/routes/Items.hpp"
#include "http/detail/routes/JsonWriter.hpp"
#include "http/detail/routes/Mailbox.hpp"
#include "settings/Secrets.hpp"

namespace velkor::http::detail {

namespace {

using configuration::ConfigurationImpl;
using configuration::ConfigurationValue;
using configuration::OptionChange;

/// Events made of what a publisher of the store delivers.
template <class T>
class StoreFeed : public EventFeed {
public:
    using Source = std::shared_ptr<reactive_streams::PublisherAPI<T>>;

    StoreFeed(Source source, Asking whenAsking, std::shared_ptr<Metrics> counts,
              Metrics::Count Metrics::*openCount)
        : publisher(std::move(source)),
          asking(whenAsking),
          metrics(std::move(counts)),
          open((*metrics).*openCount) {
        ++open;
    }

    ~StoreFeed() override {
        --open;
        try {
            // A watch that has had no subscriber would stay: only one can cancel it.
            if (mailbox == nullptr) subscribe([] {});
            mailbox->cancel();
        } catch (...) {
            return;  // the watch ends with the store
        }
    }

    StoreFeed(const StoreFeed&) = delete;
    StoreFeed& operator=(const StoreFeed&) = delete;

    void start(std::function<void()> onReady) override { subscribe(std::move(onReady)); }

    std::optional<std::string> next() override {
        auto value = mailbox->take();
        metrics->valuesConflated += mailbox->takeConflated();
        if (!value) return std::nullopt;
        ++metrics->valuesDelivered;
        return "id: " + std::to_string(++lastId) + "\ndata: " + json(*std::move(value)) + "\n\n";
    }

    bool isOver() const override { return mailbox->isOver(); }

protected:
    /// What is shown of `value`, on one line.
    virtual std::string json(T&& value) = 0;

private:
    void subscribe(std::function<void()> onReady) {
        mailbox = std::make_shared<Mailbox<T>>(asking, std::move(onReady));
        std::exchange(publisher, nullptr)->subscribe(mailbox);
    }

    Source publisher;
    const Asking asking;
    const std::shared_ptr<Metrics> metrics;
    Metrics::Count& open;
    std::shared_ptr<Mailbox<T>> mailbox;
    std::uint64_t lastId = 0;
};

class WatchFeed final : public StoreFeed<ConfigurationValue> {
public:
    WatchFeed(const std::shared_ptr<ConfigurationImpl>& watched, const std::string& watchedKey,
              std::shared_ptr<Metrics> counts)
        : StoreFeed(watched->watchOption(watchedKey), Asking::always, std::move(counts),
                    &Metrics::watchesOpen),
          store(watched),
          keys{watchedKey} {}

private:
    std::string json(ConfigurationValue&& delivered) override {
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
};

class ChangeFeed final : public StoreFeed<OptionChange> {
public:
    ChangeFeed(const std::shared_ptr<ConfigurationImpl>& watched, const std::string& prefix,
               std::shared_ptr<Metrics> counts)
        : StoreFeed(watched->watchChanges(prefix), Asking::whenTaken, std::move(counts),
                    &Metrics::changeStreamsOpen),
          store(watched) {}

private:
    std::string json(OptionChange&& change) override {
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
};

}  // namespace

std::unique_ptr<EventFeed> watchFeed(const std::shared_ptr<ConfigurationImpl>& store,
                                     const std::string& key, std::shared_ptr<Metrics> metrics) {
    return std::make_unique<WatchFeed>(store, key, std::move(metrics));
}

std::unique_ptr<EventFeed> changeFeed(const std::shared_ptr<ConfigurationImpl>& store,
                                      const std::string& prefix, std::shared_ptr<Metrics> metrics) {
    return std::make_unique<ChangeFeed>(store, prefix, std::move(metrics));
}

}  // namespace velkor::http::detail
