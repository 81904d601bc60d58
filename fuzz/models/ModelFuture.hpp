#pragma once

#include <exception>
#include <functional>
#include <memory>
#include <optional>
#include <stdexcept>
#include <utility>

namespace velkor::fuzz::models {

/// What a promise and its future share, with each rule written down where it applies.
template <class T>
struct ModelState {
    enum class Status { pending, value, exception, cancelled };

    void require(bool holds, const char* text) const {
        if (!holds) throw std::runtime_error(text);
    }

    bool isFree() const { return !isTaken && continuation == nullptr; }

    /// A result is there: whoever attached a continuation gets it, with a future as good as new.
    static void passOn(std::shared_ptr<ModelState> self) {
        if (self->continuation == nullptr || self->status == Status::cancelled) return;
        auto next = std::exchange(self->continuation, nullptr);
        self->isRetrieved = false;
        self->isTaken = false;
        next(std::move(self));
    }

    Status status = Status::pending;
    std::optional<T> value{};
    std::exception_ptr error{};
    std::function<void(std::shared_ptr<ModelState>)> continuation{};
    bool isRetrieved = false;
    bool isTaken = false;
};

template <class T>
class ModelPromise;

/// As `Future`.
template <class T>
class ModelFuture {
public:
    using State = ModelState<T>;

    ModelFuture() = default;
    explicit ModelFuture(std::shared_ptr<State> shared) : state(std::move(shared)) {}

    ModelFuture(ModelFuture&& other) noexcept
        : state(std::move(other.state)), isConsumed(std::exchange(other.isConsumed, false)) {}

    ModelFuture& operator=(ModelFuture&& other) noexcept {
        ModelFuture taken(std::move(other));
        std::swap(state, taken.state);
        std::swap(isConsumed, taken.isConsumed);
        return *this;
    }

    ~ModelFuture() = default;

    bool valid() const { return state != nullptr; }

    /// Whether `get` would wait for another thread.
    bool waits() const {
        return valid() && !isConsumed && state->isFree() && state->status == State::Status::pending;
    }

    T get() {
        requireUsable();
        state->require(state->isFree(), alreadyTaken);
        state->isTaken = true;
        if (state->status == State::Status::value)
            return *std::exchange(state->value, std::nullopt);
        state->require(state->status != State::Status::cancelled, "Future has been cancelled.");
        try {
            std::rethrow_exception(state->error);
        } catch (const std::exception_ptr& wrapped) {
            std::rethrow_exception(wrapped);
        }
    }

    template <class F>
    auto then(F f) {
        using Returned = std::invoke_result_t<F&, ModelFuture&&>;
        requireUsable();
        auto next = std::make_shared<ModelPromise<Returned>>();
        ModelFuture<Returned> future = next->getFuture();
        const auto own = state;
        isConsumed = true;
        own->require(own->isFree(), alreadyTaken);
        // Destroyed without having run, this breaks its promise.
        if (own->status == State::Status::cancelled) return future;
        own->continuation = [next = std::move(next), f](std::shared_ptr<State> resolved) mutable {
            std::optional<Returned> returned;
            try {
                returned = f(ModelFuture(std::move(resolved)));
            } catch (...) {
                return next->setException(std::current_exception());
            }
            next->setValue(*std::move(returned));
        };
        if (own->status != State::Status::pending) State::passOn(own);
        return future;
    }

    void cancel() {
        const auto own = state;
        if (own == nullptr || own->status != State::Status::pending) return;
        own->status = State::Status::cancelled;
        own->continuation = nullptr;
    }

private:
    static constexpr const char* alreadyTaken =
        "Future already returned it's value or has an associated continuation.";

    void requireUsable() const {
        if (!valid()) throw std::runtime_error("Future state isn't valid!");
        if (isConsumed) throw std::runtime_error(alreadyTaken);
    }

    std::shared_ptr<State> state;
    bool isConsumed = false;
};

/// As `Promise`.
template <class T>
class ModelPromise {
public:
    using State = ModelState<T>;

    ModelPromise() : state(std::make_shared<State>()) {}
    ModelPromise(ModelPromise&& other) noexcept : state(std::move(other.state)) {}

    ModelPromise& operator=(ModelPromise&& other) noexcept {
        ModelPromise taken(std::move(other));
        std::swap(state, taken.state);
        return *this;
    }

    ~ModelPromise() {
        if (!valid() || state->status != State::Status::pending) return;
        resolve(State::Status::exception, [](State& own) {
            own.error = std::make_exception_ptr(
                std::runtime_error("Promise destroyed before it provided a value."));
        });
    }

    bool valid() const { return state != nullptr; }

    ModelFuture<T> getFuture() {
        requireValid();
        state->require(!state->isRetrieved, "Promise already returned a future.");
        state->isRetrieved = true;
        return ModelFuture<T>(state);
    }

    void setValue(T value) {
        requireValid();
        resolve(State::Status::value, [&](State& own) { own.value = std::move(value); });
    }

    void setException(std::exception_ptr error) {
        requireValid();
        if (error == nullptr) {
            throw std::invalid_argument("A promise can't be resolved with a null exception.");
        }
        resolve(State::Status::exception, [&](State& own) { own.error = error; });
    }

private:
    void requireValid() const {
        if (!valid()) throw std::runtime_error("Promise state isn't valid!");
    }

    template <class Store>
    void resolve(typename State::Status outcome, Store store) {
        const auto own = state;  // this may be gone once the result is in
        if (own->status == State::Status::cancelled) return;
        own->require(own->status == State::Status::pending, "Promise already resolved.");
        store(*own);
        own->status = outcome;
        State::passOn(own);
    }

    std::shared_ptr<State> state;
};

}  // namespace velkor::fuzz::models
