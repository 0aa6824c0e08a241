// The model of the simulated VXI system: modules with their channels, open sessions with their
// channel numbering and groups, and the power-on state of every setting.
//
// Power-on values (ost7720_preset restores them for a channel; opening a session with reset
// restores them for every channel of its modules):
//   Inputs: active (420), range 2 V, DC coupling (101), digital anti-alias filter on (615),
//     input mode VOLT (130), trigger off (421), slope Pos/Exit (410), trigger mode Level (414),
//     lower level 5 %, upper level 10 % of the range, block size 1024, span 20000 Hz, block data
//     (340), time processing (724), time data on (270: 280), frequency data off (271: 281),
//     averaging mode 700 with 1 block and update 1, Hann window (711), single-mainframe arming
//     (431), automatic triggering on (441).
//   Sources: the first source of the lowest-address module that has one powers on active (420),
//     every other source inactive (421); Sine (170) at 1000 Hz, phase 0, range 1 V (peak),
//     output Normal (700), Sum off (190), Cola off (180), ramp rate 0 s, seed 1, duty cycle 1,
//     trigger off (421); arbitrary buffer: amplitude scale 1, block size 1024, buffer size 1024,
//     mode 4, not initialised, empty table.
//   Tachometers: active (420), trigger off (421), single-mainframe arming, automatic triggering.
//
// Coercion rules (values between supported ones are coerced up, like the hardware does):
//   block size: the next power of two at or above the request, from 64 to the largest the module
//     memory allows (at most 65536); 0 or less, or above that largest size, is refused.
//   span: 20000 Hz / 2^k, the smallest such span at or above the request (k up to 19); 0 or less,
//     or above 20000 Hz, is refused.
//   input range: the next of 0.1, 0.2, 0.5, 1, 2, 5, 10 V at or above the request (0 gives
//     0.1 V); negative or above 10 V is refused. Source range: any peak amplitude 0 to 10 V.
//   refused outside their limits: trigger levels -100..100 % of the range, averages and update
//     1..32767, ramp rate 0..100 s, sine frequency 0..25600 Hz, phase -360..360 degrees, seed
//     0..255, duty cycle 0..1, amplitude scale 0..1, source buffer size 1..8192; the source block
//     size 1..8192 is coerced up to a power of two from 64.
// The measurement and the signals are described in measure.h.
#pragma once

#include <cstdint>
#include <deque>
#include <map>
#include <optional>
#include <string>
#include <vector>

#include "codes.h"
#include "sim_control.h"

namespace sim {

inline constexpr int max_modules = 50;
inline constexpr int max_inputs_per_module = 64;
inline constexpr int max_sources_per_module = 8;
inline constexpr int max_tachs_per_module = 8;
inline constexpr int max_megabytes = 1024;
inline constexpr int max_sessions = 64;
inline constexpr int max_groups_per_session = 1024;
inline constexpr int32_t source_id_base = 4096;
inline constexpr int32_t tach_id_base = 8192;
inline constexpr int32_t first_group_id = 0x10000;  // above every channel id
inline constexpr int32_t hw_record_longs = 27;
inline constexpr int32_t hw_memory_unit = 262144;  // memory field units per MB
inline constexpr const char* interface_name = "VXI0";

inline constexpr int32_t min_blocksize = 64;
inline constexpr int32_t max_blocksize = 65536;
inline constexpr double max_span = 20000.0;
inline constexpr int max_span_halvings = 19;
inline constexpr double max_input_range = 10.0;
inline constexpr double max_source_range = 10.0;
inline constexpr double max_level_percent = 100.0;
inline constexpr double max_ramp_rate = 100.0;
inline constexpr double max_sine_freq = 25600.0;
inline constexpr double max_phase = 360.0;
inline constexpr int32_t max_seed = 255;
inline constexpr int32_t max_avg_number = 32767;
inline constexpr int32_t arb_points = 1024;
inline constexpr int32_t max_source_blocksize = 8192;
inline constexpr int default_arb_ready_polls = 3;

enum class ChannelKind { input, source, tach };

struct MeasureSettings {
    int32_t blocksize = 1024;
    double span = max_span;
    int32_t data_mode = code::data_block;
    int32_t calc_data = code::calc_time;
    int32_t enable_time = code::enable_on;
    int32_t enable_frequency = code::enable_off;
    int32_t avg_mode = code::avg_time;
    int32_t avg_number = 1;
    int32_t avg_update = 1;
    int32_t window = code::window_hann;
    int32_t arm_mode = code::arm_single;
    int32_t auto_trigger = code::auto_trigger_on;
};

struct InputSettings {
    int32_t coupling = code::coupling_dc;
    int32_t anti_alias = code::anti_alias_on;
    int32_t input_mode = code::input_volt;
    int32_t trigger_slope = code::slope_positive;
    int32_t trigger_mode = code::trigger_level;
    double level_lower = 5.0;  // percent of the range
    double level_upper = 10.0;
};

struct SourceSettings {
    int32_t mode = code::mode_sine;
    int32_t output = code::output_normal;
    int32_t sum = code::sum_off;
    int32_t cola = code::cola_off;
    double ramp_rate = 0.0;
    double sine_freq = 1000.0;
    double sine_phase = 0.0;
    int32_t seed = 1;
    double duty_cycle = 1.0;
    double amp_scale = 1.0;
    int32_t blocksize = arb_points;
    int32_t buffer_size = arb_points;
    int32_t buffer_mode = code::buffer_mode_max;
    int32_t buffer_init = 0;
    int arb_polls = 0;               // readiness polls made since the buffer was initialised
    std::vector<int32_t> arb_table;  // the downloaded waveform, played cyclically
};

// One hardware channel: everything the module holds for it.
struct Channel {
    ChannelKind kind = ChannelKind::input;
    int module = 0;               // index into System::modules
    bool primary_source = false;  // the source that powers on active
    int32_t active = code::on;
    double range = 2.0;
    int32_t trigger_channel = code::off;
    double active_since = 0;  // clock time the channel last became active
    MeasureSettings measure;
    InputSettings input;
    SourceSettings source;
};

struct Module {
    ModuleSpec config;
    int32_t largest_blocksize = max_blocksize;  // what the memory allows
    std::vector<Channel> inputs, sources, tachs;
    std::vector<Channel>& of(ChannelKind k) {
        return k == ChannelKind::input ? inputs : k == ChannelKind::source ? sources : tachs;
    }
};

struct ChannelRef {
    int module = 0;  // index into System::modules
    ChannelKind kind = ChannelKind::input;
    int index = 0;  // within the module's channels of that kind
    int32_t id = 0;
};

enum class ArmStep { none, master_setup, armed, slave_finished, master_finished };

// The session's measurement. Samples are counted from sample 0 at clock time t0 (the start, or
// the end of multi-mainframe arming); block starts are sample indexes.
struct Measurement {
    bool started = false;          // ost7720_initMeasure was called
    bool multi_mainframe = false;  // a channel had arm mode 430 at the start
    ArmStep arm = ArmStep::none;
    bool running = false;           // taking data (at once, or after the last arming step)
    std::vector<int32_t> channels;  // ids the measurement was started on
    std::vector<int32_t> inputs;    // active inputs among them: the channels that deliver data
    // Latched from the first input (or first channel) at the start.
    double t0 = 0;
    double sample_rate = 2.56 * max_span;
    int32_t blocksize = 1024;
    bool continuous = false;
    bool auto_trigger = true;
    size_t capacity = 2;  // blocks the module memory keeps
    // Trigger search.
    bool searching = true;                  // block mode: false while the last block waits to be read
    int64_t search_from = 0;                // first sample the next trigger may fall on
    int64_t scanned_to = 0;                 // input triggers have looked at samples before this
    std::map<int32_t, bool> trigger_armed;  // per input trigger channel: hysteresis state
    bool manual_pending = false;            // ost7720_triggerMeasure waits to be used
    double manual_time = 0;
    std::optional<int64_t> pending;          // trigger found, block still filling
    std::optional<int64_t> continuous_from;  // continuous mode: start of the first block
    // Completed blocks: the kept ones, numbered first_number.., and each input's next block.
    std::deque<int64_t> starts;
    int64_t first_number = 0;
    int64_t completed = 0;
    std::map<int32_t, int64_t> cursor;
};

struct Session {
    int32_t handle = 0;
    int stage = 3;             // staged opening: 1 after initA, 2 after initB3, 3 complete
    std::vector<int> modules;  // indices into System::modules, in resource-list order
    std::vector<ChannelRef> inputs, sources, tachs;
    std::map<int32_t, std::vector<int32_t>> groups;  // group id -> member channel ids
    std::string details;                             // of the session's last error
    Measurement measurement;
};

struct System {
    std::vector<Module> modules;  // in address order
    std::string config_error;     // non-empty when the environment was malformed
    std::map<int32_t, Session> sessions;
    int32_t next_handle = 1;
    int32_t next_group = first_group_id;
    std::string details;  // last error of any call, and of calls made without a session
    int arb_ready_polls = default_arb_ready_polls;
    bool virtual_clock = false;
    double virtual_now = 0;
    std::map<int32_t, std::vector<double>> input_samples;  // exact samples by channel id
};

// Seconds since power-on, on the real or the virtual clock.
double now_seconds();

// The one system, powered on from the environment before first use unless a test reset it.
System& state();

// Power-on values of a channel of this kind.
Channel power_on_channel(ChannelKind kind, bool primary_source);
void preset_channel(Channel& ch);

// Largest block size a module's memory holds for all of its channels.
int32_t largest_blocksize_for(const ModuleSpec& module);

Module* find_module(int32_t address);
Channel& channel_at(const ChannelRef& ref);

// Builds the channel numbering of a session over these modules (indices, list order).
void number_channels(Session& s);
// The channel with this id in the session, or nullptr.
const ChannelRef* find_channel(const Session& s, int32_t id);

}  // namespace sim
