#include "system.h"

#include <algorithm>
#include <chrono>
#include <cstdlib>

#include "calllog.h"
#include "parse.h"

namespace sim {

namespace {

System sys_;
bool powered_ = false;
std::chrono::steady_clock::time_point origin_ = std::chrono::steady_clock::now();

void power_on(const std::vector<ModuleSpec>& modules, std::string config_error) {
    sys_ = System{};
    origin_ = std::chrono::steady_clock::now();
    reset_call_log();
    open_trace_from_environment();
    sys_.config_error = std::move(config_error);
    if (sys_.config_error.empty()) {
        std::string error;
        if (!check_modules(modules, error)) {
            sys_.config_error = "simulated system: " + error;
        }
    }
    if (!sys_.config_error.empty())
        return;

    std::vector<ModuleSpec> sorted = modules;
    std::sort(sorted.begin(), sorted.end(),
              [](const ModuleSpec& a, const ModuleSpec& b) { return a.address < b.address; });
    bool primary_taken = false;
    for (size_t m = 0; m < sorted.size(); ++m) {
        Module mod;
        mod.config = sorted[m];
        mod.largest_blocksize = largest_blocksize_for(mod.config);
        auto make = [&](std::vector<Channel>& list, ChannelKind kind, int32_t count) {
            for (int32_t i = 0; i < count; ++i) {
                bool primary = kind == ChannelKind::source && !primary_taken;
                if (primary)
                    primary_taken = true;
                Channel ch = power_on_channel(kind, primary);
                ch.module = static_cast<int>(m);
                list.push_back(std::move(ch));
            }
        };
        make(mod.inputs, ChannelKind::input, mod.config.inputs);
        make(mod.sources, ChannelKind::source, mod.config.sources);
        make(mod.tachs, ChannelKind::tach, mod.config.tachs);
        sys_.modules.push_back(std::move(mod));
    }
}

}  // namespace

System& state() {
    if (!powered_)
        reset_from_environment();
    return sys_;
}

std::vector<ModuleSpec> default_system() {
    return {{8, 8, 1, 2, 8}, {16, 8, 1, 0, 32}};
}

void reset(const std::vector<ModuleSpec>& modules) {
    powered_ = true;
    power_on(modules, {});
}

void reset() {
    reset(default_system());
}

void reset_from_environment() {
    powered_ = true;
    std::vector<ModuleSpec> modules = default_system();
    std::string error;
    if (const char* env = std::getenv("OST7720_SIM_MODULES")) {
        std::string detail;
        if (!parse_modules(env, modules, detail))
            error = "OST7720_SIM_MODULES: " + detail;
    }
    std::vector<FailureSpec> failures;
    if (const char* env = std::getenv("OST7720_SIM_FAIL")) {
        std::string detail;
        if (!parse_failures(env, failures, detail) && error.empty())
            error = "OST7720_SIM_FAIL: " + detail;
    }
    power_on(error.empty() ? modules : std::vector<ModuleSpec>{}, error);
    set_failures(failures);
}

double now_seconds() {
    if (sys_.virtual_clock)
        return sys_.virtual_now;
    return std::chrono::duration<double>(std::chrono::steady_clock::now() - origin_).count();
}

void use_virtual_clock() {
    System& sys = state();
    if (sys.virtual_clock)
        return;
    sys.virtual_now = now_seconds();
    sys.virtual_clock = true;
}

void advance_clock(double seconds) {
    use_virtual_clock();
    if (seconds > 0)
        state().virtual_now += seconds;
}

double clock_seconds() {
    state();
    return now_seconds();
}

void set_input_samples(int32_t channel, const std::vector<double>& samples) {
    System& sys = state();
    if (samples.empty())
        sys.input_samples.erase(channel);
    else
        sys.input_samples[channel] = samples;
}

void set_arb_ready_polls(int polls) {
    state().arb_ready_polls = std::max(0, polls);
}

bool read_source(int32_t session, int32_t channel, SourceView& view) {
    System& sys = state();
    auto it = sys.sessions.find(session);
    if (it == sys.sessions.end())
        return false;
    const ChannelRef* ref = find_channel(it->second, channel);
    if (!ref || ref->kind != ChannelKind::source)
        return false;
    const Channel& c = channel_at(*ref);
    const SourceSettings& s = c.source;
    view =
        SourceView{c.active,    c.trigger_channel, s.mode,        s.output,      s.sum,         s.cola,
                   c.range,     s.ramp_rate,       s.sine_freq,   s.sine_phase,  s.seed,        s.duty_cycle,
                   s.amp_scale, s.blocksize,       s.buffer_size, s.buffer_mode, s.buffer_init, s.arb_table};
    return true;
}

Channel power_on_channel(ChannelKind kind, bool primary_source) {
    Channel ch;
    ch.kind = kind;
    ch.primary_source = primary_source;
    if (kind == ChannelKind::source) {
        ch.active = primary_source ? code::on : code::off;
        ch.range = 1.0;
    }
    return ch;
}

void preset_channel(Channel& ch) {
    int module = ch.module;
    ch = power_on_channel(ch.kind, ch.primary_source);
    ch.module = module;
    ch.active_since = now_seconds();
}

int32_t largest_blocksize_for(const ModuleSpec& module) {
    // Each measuring channel keeps two blocks of 4-byte samples (one filling, one to read).
    int64_t channels = std::max<int64_t>(1, int64_t{module.inputs} + module.tachs);
    int64_t samples = int64_t{module.megabytes} * 1048576 / (8 * channels);
    int32_t size = min_blocksize;
    while (size < max_blocksize && int64_t{size} * 2 <= samples)
        size *= 2;
    return size;
}

Module* find_module(int32_t address) {
    for (Module& m : state().modules) {
        if (m.config.address == address)
            return &m;
    }
    return nullptr;
}

Channel& channel_at(const ChannelRef& ref) {
    return state().modules[static_cast<size_t>(ref.module)].of(ref.kind)[static_cast<size_t>(ref.index)];
}

void number_channels(Session& s) {
    s.inputs.clear();
    s.sources.clear();
    s.tachs.clear();
    for (int m : s.modules) {
        const Module& mod = state().modules[static_cast<size_t>(m)];
        for (size_t i = 0; i < mod.inputs.size(); ++i)
            s.inputs.push_back(
                {m, ChannelKind::input, static_cast<int>(i), static_cast<int32_t>(s.inputs.size() + 1)});
        for (size_t i = 0; i < mod.sources.size(); ++i)
            s.sources.push_back({m, ChannelKind::source, static_cast<int>(i),
                                 source_id_base + static_cast<int32_t>(s.sources.size() + 1)});
        for (size_t i = 0; i < mod.tachs.size(); ++i)
            s.tachs.push_back({m, ChannelKind::tach, static_cast<int>(i),
                               tach_id_base + static_cast<int32_t>(s.tachs.size() + 1)});
    }
}

const ChannelRef* find_channel(const Session& s, int32_t id) {
    auto pick = [id](const std::vector<ChannelRef>& list, int32_t base) -> const ChannelRef* {
        int64_t k = int64_t{id} - base;
        if (k < 1 || k > static_cast<int64_t>(list.size()))
            return nullptr;
        return &list[static_cast<size_t>(k - 1)];
    };
    if (id > tach_id_base)
        return pick(s.tachs, tach_id_base);
    if (id > source_id_base)
        return pick(s.sources, source_id_base);
    return pick(s.inputs, 0);
}

}  // namespace sim
