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

    /// Whether calls of this run no code that could give up the store.
    bool runsOwnCodeOnly() const noexcept { return code == Code::own && table() != nullptr; }

protected:
    /// Whose code the calls of a class run: its own, or also that of others, callbacks for example,
    /// who could give up the last reference to the store. With those the store takes care of itself
    /// in each of its operations.
    enum class Code { own, foreign };

    /// Takes over `initialValues`, which is left empty. Starts without a listener. `answeringClass`
    /// is the `typeid` of the deriving class, whose `has` and `get` are those of this base.
    TableSource(const std::type_info& answeringClass, ValueMap&& initialValues,
                Code calledCode = Code::foreign);

    ~TableSource() override;

    /// Calls the listener, if there is one. What it throws passes on.
    void notify(const std::string& key) const;

    ValueTable values;

private:
    const std::type_info& answering;
    const Code code;
    ChangeListener listener;
};

}  // namespace velkor::configuration
