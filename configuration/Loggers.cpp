#include "configuration/Loggers.hpp"

namespace velkor::configuration {

// Made in this order when the library is loaded, destroyed in the opposite one when it is unloaded.
const common::DiagnosticLogger storeLogger("velkor::configuration");
const common::DiagnosticLogger propertyFileLogger("velkor::configuration::property_file");

}  // namespace velkor::configuration
