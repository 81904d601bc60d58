#pragma once

#include <cstdint>
#include <exception>
#include <functional>
#include <memory>
#include <optional>
#include <set>
#include <string>
#include <utility>
#include <vector>

#include "configuration/Changes.hpp"
#include "fuzz/models/ModelStream.hpp"
#include "fuzz/store/ModelSource.hpp"

namespace velkor::fuzz::store {

/// What a watch is.
using ModelPublisher = models::ModelStream<configuration::ConfigurationValue>;

/// What a watch of changes is.
using ModelChanges = models::ModelStream<configuration::OptionChange>;

/// The store as a list of layers and a list of watches. Answers are as they are noted; what a
/// future would fail with begins with "fails ". Owned by a shared pointer.
class ModelStore : public std::enable_shared_from_this<ModelStore> {
public:
    using Value = configuration::ConfigurationValue;
    using Change = configuration::Change;
    using Record = std::function<void(const std::string&)>;

    /// `recordLine` gets the records of the log, `noteError` the lines on standard error.
    ModelStore(Record recordLine, Record noteError);
    ~ModelStore();

    ModelStore(const ModelStore&) = delete;
    ModelStore& operator=(const ModelStore&) = delete;

    std::string get(const std::string& key);
    std::string option(const std::string& key);
    std::string has(const std::string& key);
    std::string explain(const std::string& key);
    std::string keys();
    std::string keysFrom(const std::string& first);
    std::string describe();
    std::string read(const std::vector<std::string>& keys);
    std::string set(const Step& step, const std::string* sourceName);
    std::string unset(const Step& step, const std::string* sourceName);
    std::string apply(const std::vector<Change>& changes, bool dryRun);
    std::string add(const Step& step, std::shared_ptr<ModelSource> source);
    std::string remove(const std::string& name);
    std::shared_ptr<ModelPublisher> watch(const std::string& key);
    std::shared_ptr<ModelChanges> watchChanges(const std::string& prefix);

    /// A source says that `key` has changed, with its group in front.
    void report(const std::string& key);

private:
    struct Layer {
        std::string name;
        std::string group;
        int order;
        bool readOnly;
        std::shared_ptr<ModelSource> source;
        bool reports = false;
    };
    using LayerPtr = std::shared_ptr<Layer>;

    struct Watch {
        std::shared_ptr<ModelPublisher> publisher;
        std::string key;
        std::uint64_t number;
    };

    struct ChangeWatch {
        std::shared_ptr<ModelChanges> publisher;
        std::string prefix;
        std::uint64_t number;
        std::exception_ptr failure{};  // why it lacks a change
    };

    static bool applies(const Layer& layer, const std::string& key);
    static std::string within(const Layer& layer, const std::string& key);
    LayerPtr find(const std::string& name) const;
    LayerPtr holder(const std::string& key) const;
    LayerPtr writable(const std::string& key, const std::string* sourceName) const;
    std::set<std::string> allKeys() const;
    std::string optionFrom(const Layer& layer, const std::string& key);
    Value valueFrom(const Layer& layer, const std::string& key);
    void update(const std::string& key);
    void keepChange(const std::string& key, std::vector<ChangeWatch>& due);
    void serve(const std::vector<ChangeWatch>& due);
    void tellOfChanges(const std::set<std::string>& keys, const std::string& group);
    std::function<void()> forgetting(std::uint64_t number);
    void forget(std::uint64_t number);

    /// Runs `write`, after which watchers of `key` are told by the store if `layer` didn't.
    void awaitReport(const Layer& layer, const std::string& key,
                     const std::function<bool()>& write);
    static std::string refusal(const Change& change, const LayerPtr& target);
    void writeOne(const Change& change, const Layer& target, const std::optional<Value>& value);
    void writeAll(const std::vector<Change>& changes, const std::vector<LayerPtr>& targets,
                  const std::vector<std::optional<Value>>& before);
    void tell(const std::vector<std::string>& keys);

    const Record record;
    const Record error;
    std::vector<LayerPtr> layers{};
    std::vector<Watch> watches{};
    std::vector<ChangeWatch> changeWatches{};
    std::uint64_t nextWatch = 0;
    std::vector<std::string>* deferred = nullptr;
    std::vector<std::pair<std::string, bool>> awaited{};
};

}  // namespace velkor::fuzz::store
