#include "framework/administration/Administration.hpp"

namespace velkor::administration {

Administration::~Administration() = default;

}  // namespace velkor::administration
