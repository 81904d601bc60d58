#include "http/detail/routes/Commits.hpp"

#include <algorithm>
#include <cstddef>
#include <exception>
#include <utility>

#include "configuration/sources/DurableSource.hpp"
#include "framework/common/Mutex.hpp"
#include "http/detail/routes/Problem.hpp"

namespace velkor::http::detail {

namespace {

using configuration::ConfigurationImpl;
using configuration::DurableSource;

/// An answer that waits for several layers. Thread-safe.
class AwaitedCommits {
public:
    AwaitedCommits(std::size_t count, WriteRecord&& writeRecord, PendingAnswer&& pending,
                   Response&& good)
        : record(std::move(writeRecord)),
          answer(std::move(pending)),
          response(std::move(good)),
          left(count) {}

    /// One layer has answered.
    void settle(Future<bool>&& committed) VELKOR_EXCLUDES(mutex) {
        std::exception_ptr reason;
        try {
            committed.get();
        } catch (...) {
            reason = std::current_exception();
        }
        {
            const common::MutexLock lock(mutex);
            if (reason && !failure) failure = reason;
            if (--left != 0) return;
            reason = failure;
        }
        record.answer(answer, reason ? problemResponse(reason) : std::move(response));
    }

private:
    const WriteRecord record;
    PendingAnswer answer;  // these two are used by the last one only
    Response response;
    common::Mutex mutex;
    std::exception_ptr failure VELKOR_GUARDED_BY(mutex);
    std::size_t left VELKOR_GUARDED_BY(mutex);
};

void addIfDurable(ConfigurationImpl& store, const std::string& name, Sources& found) {
    auto source = store.findSource(name).get();
    if (dynamic_cast<DurableSource*>(source.get()) != nullptr) found.push_back(std::move(source));
}

}  // namespace

Sources durableSources(ConfigurationImpl& store) {
    Sources found;
    for (const auto& description : store.describeSources().get()) {
        addIfDurable(store, description.name, found);
    }
    return found;
}

Sources durableSources(ConfigurationImpl& store, const std::vector<std::string>& names) {
    Sources found;
    for (const auto& name : names) addIfDurable(store, name, found);
    return found;
}

void answerOnceCommitted(const Sources& sources, WriteRecord record, PendingAnswer answer,
                         Response response) {
    if (sources.empty()) return record.answer(answer, std::move(response));
    const auto awaited = std::make_shared<AwaitedCommits>(sources.size(), std::move(record),
                                                          std::move(answer), std::move(response));
    for (const auto& source : sources) {
        dynamic_cast<DurableSource&>(*source).committed().then([awaited](Future<bool>&& committed) {
            awaited->settle(std::move(committed));
            return true;
        });
    }
}

}  // namespace velkor::http::detail
