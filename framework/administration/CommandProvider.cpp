#include "framework/administration/CommandProvider.hpp"

namespace velkor::administration {

CommandProvider::~CommandProvider() = default;

}  // namespace velkor::administration
