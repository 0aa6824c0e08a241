// Strict parsers for the texts the simulator takes from outside: the module list of
// OST7720_SIM_MODULES, resource strings, and the failure list of OST7720_SIM_FAIL. Each returns
// false with a one-line reason on any malformed input, and never reads past the text.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

#include "sim_control.h"

namespace sim {

// "address:inputs:sources:tachs:megabytes,..."; an empty text is the empty system.
bool parse_modules(std::string_view text, std::vector<ModuleSpec>& modules, std::string& error);

// Checks a system description: counts, ranges, unique addresses.
bool check_modules(const std::vector<ModuleSpec>& modules, std::string& error);

enum class ResourceError { none, syntax, unknown_interface };

// "VXI0::16,8::INSTR": the addresses in list order. Addresses must be 1..255 and not repeat;
// whether a module sits there is the caller's check.
ResourceError parse_resource(std::string_view text, std::vector<int32_t>& addresses, std::string& error);

struct FailureSpec {
    std::string function;
    int32_t status = 0;
    int count = -1;  // < 0: always
};

// "name:status[:count],..."; names must be driver functions.
bool parse_failures(std::string_view text, std::vector<FailureSpec>& failures, std::string& error);

// Every driver function name, for validating failure injection.
const std::vector<std::string>& function_names();

}  // namespace sim
