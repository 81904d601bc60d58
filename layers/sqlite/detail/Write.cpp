#include "layers/sqlite/detail/Write.hpp"

#include <string>
#include <utility>
#include <vector>

namespace velkor::layers::detail {

namespace {

using configuration::ConfigurationValue;

class Weight : public boost::static_visitor<std::size_t> {
public:
    template <class T>
    std::size_t operator()(const T&) const {
        return 0;
    }

    template <class Unit>
    std::size_t operator()(const std::basic_string<Unit>& text) const {
        return text.capacity() * sizeof(Unit);
    }

    template <class T>
    std::size_t operator()(const std::vector<T>& items) const {
        std::size_t weight = items.capacity() * sizeof(T);
        for (const T& item : items) weight += (*this)(item);
        return weight;
    }
};

std::size_t weightOf(const std::optional<ConfigurationValue>& value) {
    return value ? boost::apply_visitor(Weight(), *value) : 0;
}

}  // namespace

std::size_t weightOf(const Write& write) {
    return sizeof write + write.entry.key.capacity() + weightOf(write.entry.before) +
           weightOf(write.entry.after);
}

PreparedWrite::PreparedWrite(Write&& write) {
    if (write.expires) deadline.emplace(write.entry.key, *write.expires);
    element.push_back(std::move(write));
}

}  // namespace velkor::layers::detail
