#pragma once

#include <exception>
#include <stdexcept>
#include <string>
#include <vector>

#include "framework/Future.hpp"
#include "tests/framework/reactive_streams/PublisherFixture.hpp"

namespace velkor::reactive_streams {

/// An error with the text "broken".
inline std::exception_ptr broken() {
    return std::make_exception_ptr(std::runtime_error("broken"));
}

/// The text of what `callable` throws.
template <class Callable>
std::string errorOf(Callable&& callable) {
    try {
        callable();
    } catch (const std::exception& error) {
        return error.what();
    }
    return "no error";
}

/// Writes down in which order the future, the subscriber and the hook are told.
class OrderedEnd : public PublisherFixture {
protected:
    OrderedEnd() {
        observed = publisher->getCompletionFuture().then([this](Future<bool>&&) {
            steps.push_back("future");
            return true;
        });
        subscriber->whenComplete = [this] { steps.push_back("onComplete"); };
        subscriber->whenError = [this] { steps.push_back("onError"); };
        whenDone = [this] { steps.push_back("hook"); };
    }

    std::vector<std::string> steps;
    Future<bool> observed;
};

}  // namespace velkor::reactive_streams
