#pragma once

#include <exception>
#include <string>
#include <typeinfo>
#include <utility>

namespace velkor::testing {

/// The text of the exception that `callable` throws, which must be an `Exception` and not of a
/// class derived from it. Anything else gives a text that no test expects.
template <class Exception, class Callable>
std::string thrownText(Callable&& callable) {
    try {
        std::forward<Callable>(callable)();
    } catch (const std::exception& error) {
        if (typeid(error) == typeid(Exception)) return error.what();
        return std::string("<") + typeid(error).name() + "> " + error.what();
    } catch (...) {
        return "<not a std::exception>";
    }
    return "<nothing thrown>";
}

}  // namespace velkor::testing
