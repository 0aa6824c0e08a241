// The resource list of the modules in use, as the session's init call takes it; the VXI page's
// check boxes decide which modules it lists.
#pragma once

#include <string>

// "VXI0::16,8::INSTR": the modules in use from the last found to the first; empty when none.
std::string getRscsString();
