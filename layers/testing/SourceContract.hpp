#pragma once

#include <gtest/gtest.h>

#include <exception>
#include <memory>
#include <string>
#include <type_traits>

#include "layers/testing/SourceSubject.hpp"
#include "layers/testing/detail/ListenerRules.hpp"
#include "layers/testing/detail/Noted.hpp"
#include "layers/testing/detail/StoreRules.hpp"
#include "layers/testing/detail/Trial.hpp"
#include "layers/testing/detail/ValueRules.hpp"

namespace velkor::layers::testing {

/// What a store, and whoever else uses it, expects of every `ConfigurationSource`, for the tests of
/// the source, which are written with Google Test. `Subject` derives from `SourceSubject` and says
/// how the source is made and what it can do.
///
///     VELKOR_SOURCE_CONTRACT(MySource, MySubject);
///
/// Each rule is a test. One that asks for what the source can't do is skipped. No source makes a
/// test hang: what doesn't come within the subject's patience has failed, and threads that a source
/// blocks are left behind with what they use.
template <class Subject>
class SourceContract : public ::testing::Test {
protected:
    static void expect(void (*rule)(const detail::MakeSubject&)) {
        // Rules wait for one thing that doesn't come, and end.
        const auto limit = 4 * Subject().patience();
        const auto ended = detail::onOwnThread([rule] {
            try {
                rule(std::make_shared<Subject>);
            } catch (const std::exception& error) {
                ADD_FAILURE() << "An exception was thrown: " << error.what();
            }
        });
        ASSERT_TRUE(ended.comes(limit)) << "A call of the source doesn't return.";
    }
};

TYPED_TEST_SUITE_P(SourceContract);

/// The same keys whichever way the source is asked, whatever was added and changed.
TYPED_TEST_P(SourceContract, HasGetAndKeysAgree) {
    this->expect(detail::hasGetAndKeysAgree);
}

/// What `canHold` has accepted comes out as it went in, from the beginning and after a change.
TYPED_TEST_P(SourceContract, EveryKindIsKeptExactly) {
    this->expect(detail::everyKindIsKeptExactly);
}

TYPED_TEST_P(SourceContract, SetGivesWhatItReplaces) {
    this->expect(detail::setGivesWhatItReplaces);
}

TYPED_TEST_P(SourceContract, SetOfANewKeyGivesTheValue) {
    this->expect(detail::setOfANewKeyGivesTheValue);
}

/// `set` throws, nothing changes, and nobody is told.
TYPED_TEST_P(SourceContract, WhatCantBeWrittenRefuses) {
    this->expect(detail::whatCantBeWrittenRefuses);
}

/// `unset` of a `ForgettingSource` gives the value; the key has gone by the time of the one call.
TYPED_TEST_P(SourceContract, ForgettingGivesTheValueAndTellsOnce) {
    this->expect(detail::forgettingGivesTheValueAndTellsOnce);
}

TYPED_TEST_P(SourceContract, ForgettingAMissingKeyTellsNobody) {
    this->expect(detail::forgettingAMissingKeyTellsNobody);
}

/// A key that has gone by itself is a change as well.
TYPED_TEST_P(SourceContract, EveryChangeIsToldOnce) {
    this->expect(detail::everyChangeIsToldOnce);
}

/// The listener finds the new value, on the thread that calls it.
TYPED_TEST_P(SourceContract, ToldWhenItCanBeRead) {
    this->expect(detail::toldWhenItCanBeRead);
}

/// Another thread can read the source while the listener runs.
TYPED_TEST_P(SourceContract, ToldWithoutALockOfTheSource) {
    this->expect(detail::toldWithoutALockOfTheSource);
}

TYPED_TEST_P(SourceContract, ListenerCanBeReplaced) {
    this->expect(detail::listenerCanBeReplaced);
}

TYPED_TEST_P(SourceContract, ListenerCanBeTakenBack) {
    this->expect(detail::listenerCanBeTakenBack);
}

/// `setChangeListener` returns when no call of the former listener runs on another thread.
TYPED_TEST_P(SourceContract, DetachingWaitsForTheListener) {
    this->expect(detail::detachingWaitsForTheListener);
}

/// From inside the listener `setChangeListener` doesn't wait.
TYPED_TEST_P(SourceContract, ListenerMayDetachItself) {
    this->expect(detail::listenerMayDetachItself);
}

/// And finds what a lower layer holds when the key has gone by itself.
TYPED_TEST_P(SourceContract, WatcherEndsOnTheLastValue) {
    this->expect(detail::watcherEndsOnTheLastValue);
}

/// In between the store knows nothing of it.
TYPED_TEST_P(SourceContract, RemovedSourceCanBeAddedAgain) {
    this->expect(detail::removedSourceCanBeAddedAgain);
}

/// The source doesn't own the store, and can be used without it.
TYPED_TEST_P(SourceContract, SourceOutlivesItsStore) {
    this->expect(detail::sourceOutlivesItsStore);
}

REGISTER_TYPED_TEST_SUITE_P(SourceContract, HasGetAndKeysAgree, EveryKindIsKeptExactly,
                            SetGivesWhatItReplaces, SetOfANewKeyGivesTheValue,
                            WhatCantBeWrittenRefuses, ForgettingGivesTheValueAndTellsOnce,
                            ForgettingAMissingKeyTellsNobody, EveryChangeIsToldOnce,
                            ToldWhenItCanBeRead, ToldWithoutALockOfTheSource, ListenerCanBeReplaced,
                            ListenerCanBeTakenBack, DetachingWaitsForTheListener,
                            ListenerMayDetachItself, WatcherEndsOnTheLastValue,
                            RemovedSourceCanBeAddedAgain, SourceOutlivesItsStore);

namespace detail {

/// The name of a contract among the tests.
struct ContractName {
    template <class>
    static std::string GetName(int) {
        return "Rule";
    }
};

}  // namespace detail

}  // namespace velkor::layers::testing

/// Makes the tests `name`/SourceContract/Rule.* for the source that `Subject` stands for. For the
/// scope of a namespace; `name` is an identifier, and of its own in the program.
#define VELKOR_SOURCE_CONTRACT(name, Subject)                                            \
    namespace velkor_source_contract_of_##name {                                         \
        using namespace ::velkor::layers::testing;                                       \
        INSTANTIATE_TYPED_TEST_SUITE_P(name, SourceContract, Subject,                    \
                                       ::velkor::layers::testing::detail::ContractName); \
    }                                                                                    \
    static_assert(std::is_base_of_v<::velkor::layers::testing::SourceSubject, Subject>,  \
                  "a subject derives from velkor::layers::testing::SourceSubject")
