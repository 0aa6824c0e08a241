// Control of the simulated K7720A for tests and tools: the simulated system, the call log,
// failure injection. People running the real panel use the environment instead:
//   OST7720_SIM_MODULES=address:inputs:sources:tachs:megabytes,...  (empty: no module)
//   OST7720_SIM_TRACE=path                                            (one line per call)
//   OST7720_SIM_FAIL=name:status[:count],...                          (injected failures)
#pragma once

#include <cstdint>
#include <string>
#include <vector>

namespace sim {

struct ModuleSpec {
    int32_t address = 0;  // VXI logical address, 1..255
    int32_t inputs = 0;
    int32_t sources = 0;
    int32_t tachs = 0;
    int32_t megabytes = 0;
};

// Two modules: address 8 (8 inputs, 1 source, 2 tachometers, 8 MB) and address 16
// (8 inputs, 1 source, 0 tachometers, 32 MB).
std::vector<ModuleSpec> default_system();

// Powers the simulated system on afresh with these modules: every session and group gone,
// every setting at its power-on value, the call log and injected failures cleared.
void reset(const std::vector<ModuleSpec>& modules);
void reset();  // the default system

// Powers on from the environment, as the library does by itself before its first call.
void reset_from_environment();

// One driver call as the log keeps it; texts are already in their trace form.
struct Call {
    std::string name;
    std::vector<std::string> args;
    std::vector<std::string> outs;
    int32_t status = 0;
    std::string line() const;  // name(arg, ...) -> status [=> out, ...]
};

const std::vector<Call>& call_log();
std::vector<std::string> call_names();
void clear_call_log();

// Makes the named function return status without acting, count times (count < 0: always).
void fail(const std::string& function, int32_t status, int count = -1);
void clear_failures();

}  // namespace sim
