#pragma once

#include <set>
#include <string>
#include <typeinfo>

#include "configuration/sources/ConfigurationSource.hpp"
#include "configuration/sources/ValueTable.hpp"

namespace velkor::configuration {

/// Base of sources that answer from a table. The store looks keys up in the table itself, which
/// saves two virtual calls and one search for each key that is read.
///
/// Not thread-safe: the table and the listener are used with the mutex of the store held. A source
/// that changes on threads of its own answers under a lock of its own, not from here.
class VELKOR_EXPORT TableSource : public ConfigurationSource {
public:
    TableSource(const TableSource&) = delete;
    TableSource& operator=(const TableSource&) = delete;

    /// A copy of the value of `key`; `std::out_of_range` "_Map_base::at" when there is none.
    ConfigurationValue get(const std::string& key) override;

    bool has(const std::string& key) override;
    void setChangeListener(ChangeListener newListener) override;
    std::set<std::string> keys() override;

    /// The table, if this is exactly of the class that was named at construction; else null, since
    /// a class that derives from it may answer differently.
    const ValueTable* table() const noexcept {
        return typeid(*this) == answering ? &values : nullptr;
    }

    /// Whether this is exactly one of the classes of this library, which run no code of others.
    bool isBuiltIn() const noexcept { return builtIn && table() != nullptr; }

protected:
    /// Takes over `initialValues`, which is left empty. Starts without a listener. `answeringClass`
    /// is the `typeid` of the deriving class, whose `has` and `get` are those of this base.
    TableSource(const std::type_info& answeringClass, ValueMap&& initialValues);

    ~TableSource() override;

    /// Calls the listener, if there is one. What it throws passes on.
    void notify(const std::string& key) const;

    ValueTable values;

private:
    friend class InMemorySource;

    enum class Origin { thisLibrary, others };

    TableSource(const std::type_info& answeringClass, ValueMap&& initialValues, Origin origin);

    const std::type_info& answering;
    const bool builtIn;
    ChangeListener listener;
};

}  // namespace velkor::configuration
