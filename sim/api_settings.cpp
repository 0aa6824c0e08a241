// Measurement settings, the settings inputs and sources share, and the input settings.
#include <cmath>

#include "call.h"
#include "ost7720.h"

using namespace sim;

namespace {

constexpr double input_ranges[] = {0.1, 0.2, 0.5, 1.0, 2.0, 5.0, 10.0};

std::string num(double v) {
    return trace_double(v);
}

// Block size: the next power of two at or above the request, within what the module holds.
bool coerce_blocksize(int32_t request, int32_t largest, int32_t& size) {
    if (request <= 0 || request > largest)
        return false;
    size = min_blocksize;
    while (size < request)
        size *= 2;
    return true;
}

std::string check_span(double& v) {
    if (!(v > 0.0))
        return "span " + num(v) + " Hz not above 0";
    if (v > max_span)
        return "span " + num(v) + " Hz above the maximum " + num(max_span) + " Hz";
    double s = max_span;
    for (int k = 0; k < max_span_halvings && s / 2 >= v; ++k)
        s /= 2;
    v = s;
    return {};
}

std::string check_range(const Channel& ch, double& v) {
    if (std::isnan(v) || v < 0.0)
        return "range " + num(v) + " V below 0";
    if (ch.kind == ChannelKind::source) {
        if (v > max_source_range)
            return "source range " + num(v) + " V above " + num(max_source_range) + " V";
        return {};
    }
    if (v > max_input_range)
        return "range " + num(v) + " V above " + num(max_input_range) + " V";
    for (double r : input_ranges) {
        if (r >= v) {
            v = r;
            break;
        }
    }
    return {};
}

int32_t set_int_in(const char* fn, int32_t session, int32_t channel, int32_t value, const char* what,
                   int32_t lo, int32_t hi, int32_t& (*field)(Channel&)) {
    Api api(fn, session, {trace_int(session), trace_int(channel), trace_int(value)});
    if (api.injected())
        return api.status();
    std::vector<Channel*> chans;
    if (!api.resolve(session, channel, k_input, chans))
        return api.status();
    if (value < lo || value > hi)
        return api.refuse(err_invalid_value, std::string(what) + " " + std::to_string(value) + " not in " +
                                                 std::to_string(lo) + ".." + std::to_string(hi));
    for (Channel* c : chans)
        field(*c) = value;
    return api.done();
}

}  // namespace

extern "C" {

// Measurement

int32_t OST7720_CALL ost7720_setBlocksize(int32_t session, int32_t channel, int32_t blocksize) {
    Api api("ost7720_setBlocksize", session, {trace_int(session), trace_int(channel), trace_int(blocksize)});
    if (api.injected())
        return api.status();
    std::vector<Channel*> chans;
    if (!api.resolve(session, channel, k_input, chans))
        return api.status();
    int32_t size = 0;
    for (Channel* c : chans) {
        const Module& m = state().modules[static_cast<size_t>(c->module)];
        if (!coerce_blocksize(blocksize, m.largest_blocksize, size))
            return api.refuse(err_invalid_value, "block size " + std::to_string(blocksize) + " not in 1.." +
                                                     std::to_string(m.largest_blocksize) + " (module " +
                                                     std::to_string(m.config.address) + ")");
    }
    coerce_blocksize(blocksize, max_blocksize, size);
    for (Channel* c : chans)
        c->measure.blocksize = size;
    return api.done();
}

int32_t OST7720_CALL ost7720_getBlocksize(int32_t session, int32_t channel, int32_t* blocksize) {
    return get_value("ost7720_getBlocksize", session, channel, blocksize, k_input,
                     [](Channel& c) -> int32_t& { return c.measure.blocksize; });
}

int32_t OST7720_CALL ost7720_setSpan(int32_t session, int32_t channel, double span) {
    return set_double(
        "ost7720_setSpan", session, channel, span, k_input,
        [](const Channel&, double& v) { return check_span(v); },
        [](Channel& c) -> double& { return c.measure.span; });
}

int32_t OST7720_CALL ost7720_getSpan(int32_t session, int32_t channel, double* span) {
    return get_value("ost7720_getSpan", session, channel, span, k_input,
                     [](Channel& c) -> double& { return c.measure.span; });
}

int32_t OST7720_CALL ost7720_setDataMode(int32_t session, int32_t channel, int32_t mode) {
    return set_code("ost7720_setDataMode", session, channel, mode, k_input,
                    {code::data_block, code::data_continuous}, "data mode",
                    [](Channel& c) -> int32_t& { return c.measure.data_mode; });
}

int32_t OST7720_CALL ost7720_setCalcData(int32_t session, int32_t channel, int32_t calc) {
    return set_code("ost7720_setCalcData", session, channel, calc, k_input,
                    {code::calc_time, code::calc_frequency}, "processing",
                    [](Channel& c) -> int32_t& { return c.measure.calc_data; });
}

int32_t OST7720_CALL ost7720_setEnable(int32_t session, int32_t channel, int32_t kind, int32_t state_code) {
    Api api("ost7720_setEnable", session,
            {trace_int(session), trace_int(channel), trace_int(kind), trace_int(state_code)});
    if (api.injected())
        return api.status();
    std::vector<Channel*> chans;
    if (!api.resolve(session, channel, k_input, chans))
        return api.status();
    if (kind != code::kind_time && kind != code::kind_frequency)
        return api.refuse(err_invalid_code, "data kind code " + std::to_string(kind) + " unknown");
    if (state_code != code::enable_on && state_code != code::enable_off)
        return api.refuse(err_invalid_code, "enable code " + std::to_string(state_code) + " unknown");
    for (Channel* c : chans) {
        (kind == code::kind_time ? c->measure.enable_time : c->measure.enable_frequency) = state_code;
    }
    return api.done();
}

int32_t OST7720_CALL ost7720_getEnable(int32_t session, int32_t channel, int32_t kind, int32_t* state_code) {
    Api api("ost7720_getEnable", session, {trace_int(session), trace_int(channel), trace_int(kind)});
    if (api.injected())
        return api.status();
    std::vector<Channel*> chans;
    if (!api.resolve(session, channel, k_input, chans, true))
        return api.status();
    if (kind != code::kind_time && kind != code::kind_frequency)
        return api.refuse(err_invalid_code, "data kind code " + std::to_string(kind) + " unknown");
    if (!api.not_null(state_code, "state"))
        return api.status();
    const Channel& c = *chans.front();
    *state_code = kind == code::kind_time ? c.measure.enable_time : c.measure.enable_frequency;
    api.out(*state_code);
    return api.done();
}

int32_t OST7720_CALL ost7720_setAvgMode(int32_t session, int32_t channel, int32_t mode) {
    return set_code("ost7720_setAvgMode", session, channel, mode, k_input,
                    {code::avg_time, code::avg_rms, code::avg_peak_hold, code::avg_frequency},
                    "averaging mode", [](Channel& c) -> int32_t& { return c.measure.avg_mode; });
}

int32_t OST7720_CALL ost7720_setAvgNumber(int32_t session, int32_t channel, int32_t number) {
    return set_int_in("ost7720_setAvgNumber", session, channel, number, "averages", 1, max_avg_number,
                      [](Channel& c) -> int32_t& { return c.measure.avg_number; });
}

int32_t OST7720_CALL ost7720_setAvgUpdate(int32_t session, int32_t channel, int32_t update) {
    return set_int_in("ost7720_setAvgUpdate", session, channel, update, "update", 1, max_avg_number,
                      [](Channel& c) -> int32_t& { return c.measure.avg_update; });
}

int32_t OST7720_CALL ost7720_setWindow(int32_t session, int32_t channel, int32_t window) {
    return set_code("ost7720_setWindow", session, channel, window, k_input,
                    {code::window_uniform, code::window_hann, code::window_flat_top}, "window",
                    [](Channel& c) -> int32_t& { return c.measure.window; });
}

int32_t OST7720_CALL ost7720_setArmMode(int32_t session, int32_t channel, int32_t mode) {
    return set_code("ost7720_setArmMode", session, channel, mode, k_any, {code::arm_multi, code::arm_single},
                    "arm mode", [](Channel& c) -> int32_t& { return c.measure.arm_mode; });
}

int32_t OST7720_CALL ost7720_setAutoTrigger(int32_t session, int32_t channel, int32_t state_code) {
    return set_code("ost7720_setAutoTrigger", session, channel, state_code, k_any,
                    {code::auto_trigger_off, code::auto_trigger_on}, "auto trigger",
                    [](Channel& c) -> int32_t& { return c.measure.auto_trigger; });
}

// Channel settings shared by inputs and sources

// A channel switched on notes the time, from which a source's ramp runs.
int32_t OST7720_CALL ost7720_setActive(int32_t session, int32_t channel, int32_t state_code) {
    Api api("ost7720_setActive", session, {trace_int(session), trace_int(channel), trace_int(state_code)});
    if (api.injected())
        return api.status();
    std::vector<Channel*> chans;
    if (!api.resolve(session, channel, k_any, chans))
        return api.status();
    if (state_code != code::on && state_code != code::off)
        return api.refuse(err_invalid_code, "active code " + std::to_string(state_code) + " unknown");
    for (Channel* c : chans) {
        if (state_code == code::on && c->active != code::on)
            c->active_since = now_seconds();
        c->active = state_code;
    }
    return api.done();
}

int32_t OST7720_CALL ost7720_getActive(int32_t session, int32_t channel, int32_t* state_code) {
    return get_value("ost7720_getActive", session, channel, state_code, k_any,
                     [](Channel& c) -> int32_t& { return c.active; });
}

int32_t OST7720_CALL ost7720_setRange(int32_t session, int32_t channel, double range) {
    return set_double("ost7720_setRange", session, channel, range, k_input | k_source, check_range,
                      [](Channel& c) -> double& { return c.range; });
}

int32_t OST7720_CALL ost7720_getRange(int32_t session, int32_t channel, double* range) {
    return get_value("ost7720_getRange", session, channel, range, k_input | k_source,
                     [](Channel& c) -> double& { return c.range; });
}

int32_t OST7720_CALL ost7720_setTriggerChannel(int32_t session, int32_t channel, int32_t state_code) {
    return set_code("ost7720_setTriggerChannel", session, channel, state_code, k_any, {code::on, code::off},
                    "trigger", [](Channel& c) -> int32_t& { return c.trigger_channel; });
}

int32_t OST7720_CALL ost7720_getTriggerChannel(int32_t session, int32_t channel, int32_t* state_code) {
    return get_value("ost7720_getTriggerChannel", session, channel, state_code, k_any,
                     [](Channel& c) -> int32_t& { return c.trigger_channel; });
}

int32_t OST7720_CALL ost7720_preset(int32_t session, int32_t channel) {
    Api api("ost7720_preset", session, {trace_int(session), trace_int(channel)});
    if (api.injected())
        return api.status();
    std::vector<Channel*> chans;
    if (!api.resolve(session, channel, k_any, chans))
        return api.status();
    for (Channel* c : chans)
        preset_channel(*c);
    return api.done();
}

// Input

int32_t OST7720_CALL ost7720_setCoupling(int32_t session, int32_t channel, int32_t coupling) {
    return set_code("ost7720_setCoupling", session, channel, coupling, k_input,
                    {code::coupling_ac, code::coupling_dc}, "coupling",
                    [](Channel& c) -> int32_t& { return c.input.coupling; });
}

int32_t OST7720_CALL ost7720_getCoupling(int32_t session, int32_t channel, int32_t* coupling) {
    return get_value("ost7720_getCoupling", session, channel, coupling, k_input,
                     [](Channel& c) -> int32_t& { return c.input.coupling; });
}

int32_t OST7720_CALL ost7720_setAntiAliasDigital(int32_t session, int32_t channel, int32_t state_code) {
    return set_code("ost7720_setAntiAliasDigital", session, channel, state_code, k_input,
                    {code::anti_alias_on, code::anti_alias_off}, "anti-alias",
                    [](Channel& c) -> int32_t& { return c.input.anti_alias; });
}

int32_t OST7720_CALL ost7720_getAntiAliasDigital(int32_t session, int32_t channel, int32_t* state_code) {
    return get_value("ost7720_getAntiAliasDigital", session, channel, state_code, k_input,
                     [](Channel& c) -> int32_t& { return c.input.anti_alias; });
}

int32_t OST7720_CALL ost7720_setInputMode(int32_t session, int32_t channel, int32_t mode) {
    return set_code(
        "ost7720_setInputMode", session, channel, mode, k_input,
        {code::input_volt, code::input_icp, code::input_charge, code::input_mic, code::input_mic_200v},
        "input mode", [](Channel& c) -> int32_t& { return c.input.input_mode; });
}

int32_t OST7720_CALL ost7720_getInputMode(int32_t session, int32_t channel, int32_t* mode) {
    return get_value("ost7720_getInputMode", session, channel, mode, k_input,
                     [](Channel& c) -> int32_t& { return c.input.input_mode; });
}

int32_t OST7720_CALL ost7720_setTriggerSlope(int32_t session, int32_t channel, int32_t slope) {
    return set_code("ost7720_setTriggerSlope", session, channel, slope, k_input,
                    {code::slope_positive, code::slope_negative}, "slope",
                    [](Channel& c) -> int32_t& { return c.input.trigger_slope; });
}

int32_t OST7720_CALL ost7720_getTriggerSlope(int32_t session, int32_t channel, int32_t* slope) {
    return get_value("ost7720_getTriggerSlope", session, channel, slope, k_input,
                     [](Channel& c) -> int32_t& { return c.input.trigger_slope; });
}

int32_t OST7720_CALL ost7720_setTriggerMode(int32_t session, int32_t channel, int32_t mode) {
    return set_code("ost7720_setTriggerMode", session, channel, mode, k_input,
                    {code::trigger_level, code::trigger_bound}, "trigger mode",
                    [](Channel& c) -> int32_t& { return c.input.trigger_mode; });
}

int32_t OST7720_CALL ost7720_getTriggerMode(int32_t session, int32_t channel, int32_t* mode) {
    return get_value("ost7720_getTriggerMode", session, channel, mode, k_input,
                     [](Channel& c) -> int32_t& { return c.input.trigger_mode; });
}

// Levels are percent of the range, -100 to 100; the two levels are independent, so either
// may be set first.
int32_t OST7720_CALL ost7720_setTriggerLevel(int32_t session, int32_t channel, int32_t which, double level) {
    Api api("ost7720_setTriggerLevel", session,
            {trace_int(session), trace_int(channel), trace_int(which), trace_double(level)});
    if (api.injected())
        return api.status();
    std::vector<Channel*> chans;
    if (!api.resolve(session, channel, k_input, chans))
        return api.status();
    if (which != code::level_lower && which != code::level_upper)
        return api.refuse(err_invalid_code, "level selector " + std::to_string(which) + " unknown");
    if (!(level >= -max_level_percent && level <= max_level_percent))
        return api.refuse(err_invalid_value, "trigger level " + num(level) + " % not in -100..100");
    for (Channel* c : chans)
        (which == code::level_lower ? c->input.level_lower : c->input.level_upper) = level;
    return api.done();
}

int32_t OST7720_CALL ost7720_getTriggerLevel(int32_t session, int32_t channel, int32_t which, double* level) {
    Api api("ost7720_getTriggerLevel", session, {trace_int(session), trace_int(channel), trace_int(which)});
    if (api.injected())
        return api.status();
    std::vector<Channel*> chans;
    if (!api.resolve(session, channel, k_input, chans, true))
        return api.status();
    if (which != code::level_lower && which != code::level_upper)
        return api.refuse(err_invalid_code, "level selector " + std::to_string(which) + " unknown");
    if (!api.not_null(level, "level"))
        return api.status();
    const Channel& c = *chans.front();
    *level = which == code::level_lower ? c.input.level_lower : c.input.level_upper;
    api.out(*level);
    return api.done();
}

}  // extern "C"
