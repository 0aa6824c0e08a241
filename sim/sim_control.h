// Control of the simulated K7720A for tests and tools: the simulated system, the call log,
// failure injection, the clock, exact input samples and a look at what a source holds. People running the
// real panel use the environment instead:
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

// The clock the measurement runs on, in seconds since power-on. Real (steady) time by default;
// after use_virtual_clock it stands still until a test advances it. Power-on returns to real time.
void use_virtual_clock();
void advance_clock(double seconds);
double clock_seconds();

// Exact input samples for the input channel with this id (in whatever session reads it): sample
// i of every block it delivers is samples[i % size], with no source, noise, coupling or clipping;
// a trigger on the channel sees the samples repeated from the measurement start. An empty list
// gives the channel its simulated signal back. Power-on clears them all.
void set_input_samples(int32_t channel, const std::vector<double>& samples);

// Readiness polls (ost7720_checkSrcArbRdy) the arbitrary buffer takes after initialisation
// before it reports ready; 3 at power-on.
void set_arb_ready_polls(int polls);

// What a source holds: its settings and its arbitrary table.
struct SourceView {
    int32_t active = 0;
    int32_t trigger = 0;
    int32_t mode = 0;
    int32_t output = 0;
    int32_t sum = 0;
    int32_t cola = 0;
    double range = 0;
    double ramp_rate = 0;
    double sine_freq = 0;
    double sine_phase = 0;
    int32_t seed = 0;
    double duty_cycle = 0;
    double amp_scale = 0;
    int32_t blocksize = 0;
    int32_t buffer_size = 0;
    int32_t buffer_mode = 0;
    int32_t buffer_init = 0;
    std::vector<int32_t> table;
};

// The source with this channel id in an open session; false when there is none.
bool read_source(int32_t session, int32_t channel, SourceView& view);

}  // namespace sim
