// The driver's codes, as the simulator knows them.
#pragma once

#include "ost7720_codes.h"

namespace sim {
namespace code = ::ost7720_code;
}  // namespace sim
