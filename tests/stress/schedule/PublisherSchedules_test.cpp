#include <gtest/gtest.h>

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <exception>
#include <functional>
#include <limits>
#include <map>
#include <memory>
#include <mutex>
#include <stdexcept>
#include <string>
#include <thread>
#include <utility>
#include <vector>

#include "framework/reactive_streams/CachedValuePublisher.hpp"
#include "framework/reactive_streams/CallbackSubscriber.hpp"
#include "framework/reactive_streams/ConflatingPublisher.hpp"
#include "tests/stress/schedule/Schedules.hpp"

namespace velkor::testing::schedule {
namespace {

using reactive_streams::CachedValuePublisher;
using reactive_streams::Callbacks;
using reactive_streams::ConflatingPublisher;
using reactive_streams::Demand;
using reactive_streams::Subscriber;
using reactive_streams::Subscription;
using reactive_streams::SubscriptionHandle;

constexpr auto allValues = std::numeric_limits<std::uint64_t>::max();

using Hook = std::function<void()>;

/// What a subscriber is told. One thread runs at a time: it needs no lock.
template <class T>
class Listener final : public Subscriber<T> {
public:
    using Subscriber<T>::onNext;

    explicit Listener(std::uint64_t demand) : first(demand) {}

    void onSubscribe(std::weak_ptr<Subscription> opened) override {
        subscription = opened.lock();
        if (first > 0) subscription->request(first);
    }

    void onNext(T&& value) override {
        if (inside++ > 0) overlaps = true;
        values.push_back(std::move(value));
        std::this_thread::yield();
        whenTold();
        --inside;
    }

    void onComplete() override { ++completions; }
    void onError(const std::exception_ptr&) override { ++errors; }

    std::vector<T> values;
    int completions = 0;
    int errors = 0;
    bool overlaps = false;
    Hook whenTold = [] {};
    std::shared_ptr<Subscription> subscription;

private:
    const std::uint64_t first;
    int inside = 0;
};

/// A stream of numbers with its listener.
struct Watch {
    using Stream = CachedValuePublisher<int, Hook>;

    explicit Watch(std::uint64_t capacity, std::uint64_t demand)
        : publisher(std::make_shared<Stream>(capacity, [this] { ++endings; })),
          completed(publisher->getCompletionFuture()),
          listener(std::make_shared<Listener<int>>(demand)) {}

    Watch& subscribed() {
        publisher->subscribe(listener);
        return *this;
    }

    Hook publishing(std::vector<int> values) const {
        return [this, values] {
            for (const int value : values) publisher->publish(value);
        };
    }
    Hook requesting(std::uint64_t more) const {
        return [this, more] { listener->subscription->request(more); };
    }
    Hook cancelling() const {
        return [this] { listener->subscription->cancel(); };
    }
    Hook completing() const {
        return [this] { publisher->complete(); };
    }
    Hook subscribing() const {
        return [this] { publisher->subscribe(listener); };
    }

    void requireValues(std::vector<int> expected) const {
        std::string text = "values:";
        for (const int value : listener->values) text += " " + std::to_string(value);
        require(listener->values == expected, text);
    }
    void requireOnce(std::vector<int> expected) const {
        auto sorted = listener->values;
        std::sort(sorted.begin(), sorted.end());
        require(sorted == expected, "a value was lost or came twice");
    }
    void requireEnd(int completions) const {
        requireEqual(endings, 1, "ends");
        requireEqual(listener->completions, completions, "completions");
    }

    int endings = 0;
    std::shared_ptr<Stream> publisher;
    Future<bool> completed;
    std::shared_ptr<Listener<int>> listener;
};

class PublisherSchedules : public Schedules {};

TEST_F(PublisherSchedules, NothingBeginsAfterACancel) {
    expectAlways([](const Together& together) {
        Watch watch(1, allValues);
        watch.subscribed();
        together({watch.publishing({1, 2, 3}), watch.cancelling()});
        const auto told = watch.listener->values;
        watch.publisher->publish(4);
        watch.requireValues(told);
        watch.requireEnd(0);
        require(!watch.completed.get(), "a cancelled stream completed");
        requireEqual(watch.listener.use_count(), 1, "references to the subscriber");
    });
}

TEST_F(PublisherSchedules, CancelBesideADrainLetsTheSubscriberGo) {
    expectAlways([](const Together& together) {
        Watch watch(2, 0);
        watch.subscribed().publishing({1, 2})();
        together({watch.requesting(1), watch.requesting(1), watch.cancelling()});
        require(watch.listener->values.size() <= 2, "more than was asked for");
        watch.requireEnd(0);
        requireEqual(watch.listener.use_count(), 1, "references to the subscriber");
    });
}

TEST_F(PublisherSchedules, ARequestBesideAPublishLosesNoValue) {
    expectAlways([](const Together& together) {
        Watch watch(1, 0);
        watch.subscribed();
        together({watch.requesting(1), watch.publishing({1})});
        watch.requireValues({1});
    });
}

TEST_F(PublisherSchedules, ASubscriptionBesideAPublishLosesNoValue) {
    expectAlways([](const Together& together) {
        Watch watch(1, allValues);
        together({watch.subscribing(), watch.publishing({1})});
        watch.requireValues({1});
    });
}

TEST_F(PublisherSchedules, OneOfTwoSubscriptionsIsRefused) {
    expectAlways([](const Together& together) {
        Watch watch(1, allValues);
        int refused = 0;
        const auto subscribe = [&] {
            try {
                watch.publisher->subscribe(std::make_shared<Listener<int>>(allValues));
            } catch (const std::invalid_argument&) {
                ++refused;
            }
        };
        together({subscribe, subscribe});
        requireEqual(refused, 1, "refused");
    });
}

TEST_F(PublisherSchedules, TwoPublishersKeepToTheDemand) {
    expectAlways([](const Together& together) {
        Watch watch(4, 1);
        watch.subscribed();
        together({watch.publishing({1, 2}), watch.publishing({3, 4}), watch.requesting(1)});
        requireEqual(watch.listener->values.size(), 2U, "values");
        watch.requesting(allValues)();
        watch.requireOnce({1, 2, 3, 4});
    });
}

TEST_F(PublisherSchedules, KeptValuesArriveInOrderWhoeverAsks) {
    expectAlways([](const Together& together) {
        Watch watch(3, 0);
        watch.subscribed().publishing({1, 2, 3})();
        together({watch.requesting(1), watch.requesting(2)});
        watch.requireValues({1, 2, 3});
        require(!watch.listener->overlaps, "kept values were delivered at the same time");
    });
}

TEST_F(PublisherSchedules, ACompletionBesideTheRequestThatDrainsEndsTheStreamOnce) {
    expectAlways([](const Together& together) {
        Watch watch(1, 0);
        watch.subscribed().publishing({1})();
        together({watch.requesting(1), watch.completing()});
        watch.requireValues({1});
        watch.requireEnd(1);
        require(watch.completed.get(), "a completed stream was cancelled");
    });
}

TEST_F(PublisherSchedules, WhatIsPublishedBeforeACompletionIsDelivered) {
    expectAlways([](const Together& together) {
        Watch watch(2, 0);
        watch.subscribed();
        together({[&] {
                      watch.publishing({1, 2})();
                      watch.publisher->complete();
                  },
                  watch.requesting(1), watch.requesting(1)});
        watch.requireOnce({1, 2});
        watch.requireEnd(1);
    });
}

TEST_F(PublisherSchedules, AStreamEndsInOneWay) {
    expectAlways([](const Together& together) {
        Watch watch(1, 0);
        watch.subscribed();
        const auto fail = [&] {
            watch.publisher->fail(std::make_exception_ptr(std::runtime_error("broken")));
        };
        together({watch.completing(), watch.cancelling(), fail});
        requireEqual(watch.endings, 1, "ends");
        const int told = watch.listener->completions + watch.listener->errors;
        bool completed = false;
        try {
            completed = watch.completed.get();
            requireEqual(told, completed ? 1 : 0, "told of the end");
        } catch (const std::runtime_error&) {
            requireEqual(watch.listener->errors, 1, "told of the error");
        }
    });
}

TEST_F(PublisherSchedules, TheEndOfThePublisherBesideARequestTellsOnce) {
    expectAlways([](const Together& together) {
        Watch watch(1, 0);
        watch.subscribed().publishing({1})();
        together({watch.requesting(1), [&] { watch.publisher.reset(); }});
        require(watch.listener->values.size() <= 1, "more than was asked for");
        watch.requireEnd(1);
    });
}

TEST_F(PublisherSchedules, TheEndOfThePublisherBesideACancelTellsOnce) {
    expectAlways([](const Together& together) {
        Watch watch(1, 0);
        watch.subscribed();
        together({watch.cancelling(), [&] { watch.publisher.reset(); }});
        watch.requireEnd(watch.completed.get() ? 1 : 0);
    });
}

TEST_F(PublisherSchedules, AFutureAskedForBesideTheEndHears) {
    expectAlways([](const Together& together) {
        auto publisher = std::make_shared<Watch::Stream>(1, [] {});
        int continued = 0;
        together({[&] {
                      auto told = publisher->getCompletionFuture().then([&](Future<bool> end) {
                          ++continued;
                          return end.get();
                      });
                      require(told.get(), "the future of a completed stream says it was cancelled");
                  },
                  [&] { publisher->complete(); }});
        requireEqual(continued, 1, "continuations");
    });
}

TEST_F(PublisherSchedules, ASubscriberThatPublishesLosesNothing) {
    expectAlways([](const Together& together) {
        Watch watch(4, allValues);
        watch.subscribed();
        bool hasPublished = false;
        watch.listener->whenTold = [&] {
            if (!std::exchange(hasPublished, true)) watch.publisher->publish(10);
        };
        together({watch.publishing({1}), watch.publishing({2})});
        watch.requireOnce({1, 2, 10});
    });
}

TEST_F(PublisherSchedules, ASubscriberThatAsksForEachLosesNothing) {
    expectAlways([](const Together& together) {
        Watch watch(4, 1);
        watch.subscribed();
        watch.listener->whenTold = [&] { watch.listener->subscription->request(1); };
        together({watch.publishing({1, 2}), watch.publishing({3})});
        watch.requireOnce({1, 2, 3});
    });
}

TEST_F(PublisherSchedules, AThrowingSubscriberLeavesTheStreamUsable) {
    expectAlways([](const Together& together) {
        Watch watch(4, 0);
        watch.subscribed().publishing({1, 2})();
        bool hasThrown = false;
        watch.listener->whenTold = [&] {
            if (!std::exchange(hasThrown, true)) throw std::runtime_error("broken");
        };
        const auto caught = [](const Hook& call) {
            return [call] {
                try {
                    call();
                } catch (const std::runtime_error&) {
                    return;
                }
            };
        };
        together({caught(watch.requesting(1)), caught(watch.requesting(1)),
                  caught(watch.publishing({3}))});
        watch.requesting(1)();
        watch.requireOnce({1, 2, 3});
    });
}

/// A stream with a handle, whose callback counts.
struct HandledWatch {
    explicit HandledWatch(Demand demand)
        : publisher(std::make_shared<Watch::Stream>(1, [this] { ++endings; })),
          handle(reactive_streams::subscribe(*publisher, {[this](int) { told(); }}, demand)) {}

    int endings = 0;
    int values = 0;
    Hook whenTold = [] {};
    std::shared_ptr<Watch::Stream> publisher;
    SubscriptionHandle handle;

private:
    void told() {
        ++values;
        whenTold();
    }
};

TEST_F(PublisherSchedules, AHandleDestroyedBesideAPublishEndsTheStream) {
    for (const Demand demand : {Demand::oneAtATime, Demand::unbounded}) {
        expectAlways([demand](const Together& together) {
            HandledWatch watch(demand);
            together({[&] { watch.handle = SubscriptionHandle(); },
                      [&] { watch.publisher->publish(1); }, [&] { watch.publisher->publish(2); }});
            const int told = watch.values;
            watch.publisher->publish(3);
            requireEqual(watch.values, told, "values");
            requireEqual(watch.endings, 1, "ends");
        });
    }
}

TEST_F(PublisherSchedules, AHandleDestroyedBesideThePublisherEndsTheStreamOnce) {
    expectAlways([](const Together& together) {
        HandledWatch watch(Demand::unbounded);
        together({[&] { watch.handle = SubscriptionHandle(); }, [&] { watch.publisher.reset(); }});
        requireEqual(watch.endings, 1, "ends");
    });
}

TEST_F(PublisherSchedules, AHandleDestroyedByItsCallbackEndsTheStreamOnce) {
    expectAlways([](const Together& together) {
        HandledWatch watch(Demand::oneAtATime);
        watch.whenTold = [&] {
            if (watch.values == 1) watch.handle = SubscriptionHandle();
        };
        together({[&] { watch.publisher->publish(1); }, [&] { watch.publisher->publish(2); },
                  [&] { watch.publisher->complete(); }});
        require(watch.values <= 2, "values that nobody published");
        requireEqual(watch.endings, 1, "ends");
    });
}

TEST_F(PublisherSchedules, WhoAsksForOneAtATimeIsToldTheNewest) {
    expectAlways([](const Together& together) {
        int last = 0;
        auto publisher = std::make_shared<Watch::Stream>(1, [] {});
        const auto handle = reactive_streams::subscribe(
            *publisher, Callbacks<int>{[&](int value) { last = value; }}, Demand::oneAtATime);
        together({[&] { publisher->publish(1); }, [&] { publisher->publish(2); }});
        require(last > 0, "nobody was told");
    });
}

struct Change {
    std::string key;
    int version;
};

struct KeyOfChange {
    const std::string& operator()(const Change& change) const noexcept { return change.key; }
};

/// A stream that keeps the newest of each key, with its listener.
struct Changes {
    using Stream = ConflatingPublisher<Change, KeyOfChange, Hook>;

    explicit Changes(std::uint64_t demand) : listener(std::make_shared<Listener<Change>>(demand)) {
        publisher->subscribe(listener);
    }

    // As the store does: versions are counted and kept under one lock, delivered without it.
    Hook changing(const std::string& key) {
        return [this, key] {
            {
                const std::lock_guard<std::mutex> lock(mutex);
                publisher->keep({{key, ++version}});
            }
            publisher->deliver();
        };
    }

    void requireOrder() const {
        require(!listener->overlaps, "two changes were delivered at the same time");
        std::map<std::string, int> newest;
        for (const Change& change : listener->values) {
            require(newest[change.key] < change.version, "an older change came after a newer one");
            newest[change.key] = change.version;
        }
    }
    void requireLast(const std::string& key, int newest) const {
        const auto last = std::find_if(listener->values.rbegin(), listener->values.rend(),
                                       [&](const Change& change) { return change.key == key; });
        require(last != listener->values.rend(), "a key was not told of");
        requireEqual(last->version, newest, "the last version of " + key);
    }

    std::mutex mutex;
    int version = 0;
    int endings = 0;
    std::shared_ptr<Stream> publisher = std::make_shared<Stream>([this] { ++endings; });
    std::shared_ptr<Listener<Change>> listener;
};

class ConflatingPublisherSchedules : public Schedules {};

TEST_F(ConflatingPublisherSchedules, TellsTheNewestOfAKeyInOrder) {
    expectAlways([](const Together& together) {
        Changes changes(allValues);
        together({changes.changing("a"), changes.changing("a"), changes.changing("a")});
        changes.requireOrder();
        changes.requireLast("a", 3);
    });
}

TEST_F(ConflatingPublisherSchedules, TellsOfEveryKeyWhoeverAsks) {
    expectAlways([](const Together& together) {
        Changes changes(0);
        changes.changing("a")();
        const auto request = [&] { changes.listener->subscription->request(1); };
        together({changes.changing("b"), request, request});
        changes.requireOrder();
        changes.requireLast("a", 1);
        changes.requireLast("b", 2);
    });
}

TEST_F(ConflatingPublisherSchedules, KeepsTheNewestOfAKeyForWhoAsksLate) {
    expectAlways([](const Together& together) {
        Changes changes(1);
        together({changes.changing("a"), changes.changing("a"), changes.changing("b")});
        changes.listener->subscription->request(allValues);
        changes.requireOrder();
        const auto& told = changes.listener->values;
        require(std::any_of(told.begin(), told.end(),
                            [](const Change& change) { return change.version == 3; }),
                "the newest change was lost");
    });
}

TEST_F(ConflatingPublisherSchedules, CancelBesideChangesLetsTheSubscriberGo) {
    expectAlways([](const Together& together) {
        Changes changes(allValues);
        together({changes.changing("a"), changes.changing("b"),
                  [&] { changes.listener->subscription->cancel(); }});
        const auto told = changes.listener->values.size();
        changes.changing("c")();
        requireEqual(changes.listener->values.size(), told, "changes");
        requireEqual(changes.endings, 1, "ends");
        requireEqual(changes.listener.use_count(), 1, "references to the subscriber");
    });
}

TEST_F(ConflatingPublisherSchedules, CompletionBesideChangesEndsTheStreamOnce) {
    expectAlways([](const Together& together) {
        Changes changes(0);
        changes.changing("a")();
        together({[&] { changes.listener->subscription->request(1); },
                  [&] { changes.publisher->complete(); }});
        changes.requireLast("a", 1);
        requireEqual(changes.listener->completions, 1, "completions");
        requireEqual(changes.endings, 1, "ends");
    });
}

}  // namespace
}  // namespace velkor::testing::schedule
