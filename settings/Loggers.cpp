#include "settings/Loggers.hpp"

namespace velkor::settings {

const common::DiagnosticLogger settingsLogger("velkor::settings");

}  // namespace velkor::settings
