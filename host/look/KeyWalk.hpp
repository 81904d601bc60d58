#pragma once

#include <functional>
#include <string>

#include "configuration/ConfigurationImpl.hpp"

namespace velkor::host {

/// Calls `visit` with each key of `store` from `first` on, sorted byte by byte, until that gives
/// false. The keys are asked for in pages, the first of which is small: keys that come and go
/// meanwhile may be missed or be gone when they are visited. Throws `Interrupted` once Ctrl-C was
/// pressed.
void walkKeys(configuration::ConfigurationImpl& store, const std::string& first,
              const std::function<bool(const std::string& key)>& visit);

}  // namespace velkor::host
