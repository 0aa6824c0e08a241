// The call log and trace: every driver call is recorded with its arguments, out-values and
// status, kept in memory for tests (sim::call_log) and, with OST7720_SIM_TRACE set, appended to
// a file one line per call. Also holds the injected failures.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "parse.h"
#include "sim_control.h"

namespace sim {

// Trace forms of argument and out-values.
std::string trace_int(int64_t v);
std::string trace_double(double v);                           // shortest round-trip form
std::string trace_text(const char* text, size_t max_length);  // quoted, trailing blanks removed
std::string trace_array(const void* data, int64_t count);     // "[count]", or "null"

void record_call(Call call);

// Opens the trace file named by OST7720_SIM_TRACE (closes it when unset or empty).
void open_trace_from_environment();

// Empties the log and the failure list (at power-on).
void reset_call_log();

void set_failures(const std::vector<FailureSpec>& failures);
// True when the function is to fail now; counts the failure down.
bool take_failure(const std::string& function, int32_t& status);

}  // namespace sim
