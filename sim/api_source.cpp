// Source settings and the arbitrary waveform buffer.
#include <cmath>

#include "call.h"
#include "ost7720.h"

using namespace sim;

namespace {

std::string num(double v) {
    return trace_double(v);
}

// A check for set_double: the value must lie in lo..hi (NaN never does).
auto within(const char* what, double lo, double hi) {
    return [what, lo, hi](const Channel&, double& v) -> std::string {
        if (v >= lo && v <= hi)
            return {};
        return std::string(what) + " " + num(v) + " not in " + num(lo) + ".." + num(hi);
    };
}

int32_t set_source_int(const char* fn, int32_t session, int32_t channel, int32_t value, const char* what,
                       int32_t lo, int32_t hi, int32_t& (*field)(Channel&)) {
    Api api(fn, session, {trace_int(session), trace_int(channel), trace_int(value)});
    if (api.injected())
        return api.status();
    std::vector<Channel*> chans;
    if (!api.resolve(session, channel, k_source, chans))
        return api.status();
    if (value < lo || value > hi)
        return api.refuse(err_invalid_value, std::string(what) + " " + std::to_string(value) + " not in " +
                                                 std::to_string(lo) + ".." + std::to_string(hi));
    for (Channel* c : chans)
        field(*c) = value;
    return api.done();
}

// One source channel (the buffer calls address a single source).
Channel* one_source(Api& api, int32_t session, int32_t channel) {
    Session* s = api.session(session);
    if (!s)
        return nullptr;
    if (s->groups.count(channel)) {
        api.refuse(err_invalid_channel, "group " + std::to_string(channel) + ": the buffer takes one source");
        return nullptr;
    }
    std::vector<Channel*> chans;
    if (!api.targets(*s, channel, k_source, chans, true))
        return nullptr;
    return chans.front();
}

bool check_buffer_mode(Api& api, int32_t mode) {
    if (mode >= code::buffer_mode_min && mode <= code::buffer_mode_max)
        return true;
    api.refuse(err_invalid_code, "buffer mode " + std::to_string(mode) + " unknown");
    return false;
}

}  // namespace

extern "C" {

int32_t OST7720_CALL ost7720_setSourceMode(int32_t session, int32_t channel, int32_t mode) {
    return set_code("ost7720_setSourceMode", session, channel, mode, k_source,
                    {code::mode_sine, code::mode_burst_sine, code::mode_random, code::mode_burst_random,
                     code::mode_zoom_random, code::mode_burst_zoom_random, code::mode_arbitrary,
                     code::mode_burst_arbitrary},
                    "source mode", [](Channel& c) -> int32_t& { return c.source.mode; });
}

int32_t OST7720_CALL ost7720_getSourceMode(int32_t session, int32_t channel, int32_t* mode) {
    return get_value("ost7720_getSourceMode", session, channel, mode, k_source,
                     [](Channel& c) -> int32_t& { return c.source.mode; });
}

int32_t OST7720_CALL ost7720_setSourceOutput(int32_t session, int32_t channel, int32_t output) {
    return set_code(
        "ost7720_setSourceOutput", session, channel, output, k_source,
        {code::output_normal, code::output_grounded, code::output_open, code::output_cal, code::output_multi},
        "output", [](Channel& c) -> int32_t& { return c.source.output; });
}

int32_t OST7720_CALL ost7720_getSourceOutput(int32_t session, int32_t channel, int32_t* output) {
    return get_value("ost7720_getSourceOutput", session, channel, output, k_source,
                     [](Channel& c) -> int32_t& { return c.source.output; });
}

int32_t OST7720_CALL ost7720_setSourceSum(int32_t session, int32_t channel, int32_t state_code) {
    return set_code("ost7720_setSourceSum", session, channel, state_code, k_source,
                    {code::sum_off, code::sum_on}, "sum",
                    [](Channel& c) -> int32_t& { return c.source.sum; });
}

int32_t OST7720_CALL ost7720_getSourceSum(int32_t session, int32_t channel, int32_t* state_code) {
    return get_value("ost7720_getSourceSum", session, channel, state_code, k_source,
                     [](Channel& c) -> int32_t& { return c.source.sum; });
}

int32_t OST7720_CALL ost7720_setSourceCola(int32_t session, int32_t channel, int32_t state_code) {
    return set_code("ost7720_setSourceCola", session, channel, state_code, k_source,
                    {code::cola_off, code::cola_on}, "cola",
                    [](Channel& c) -> int32_t& { return c.source.cola; });
}

int32_t OST7720_CALL ost7720_getSourceCola(int32_t session, int32_t channel, int32_t* state_code) {
    return get_value("ost7720_getSourceCola", session, channel, state_code, k_source,
                     [](Channel& c) -> int32_t& { return c.source.cola; });
}

int32_t OST7720_CALL ost7720_setRampRate(int32_t session, int32_t channel, double seconds) {
    return set_double("ost7720_setRampRate", session, channel, seconds, k_source,
                      within("ramp rate", 0.0, max_ramp_rate),
                      [](Channel& c) -> double& { return c.source.ramp_rate; });
}

int32_t OST7720_CALL ost7720_getRampRate(int32_t session, int32_t channel, double* seconds) {
    return get_value("ost7720_getRampRate", session, channel, seconds, k_source,
                     [](Channel& c) -> double& { return c.source.ramp_rate; });
}

int32_t OST7720_CALL ost7720_setSineFreq(int32_t session, int32_t channel, double hertz) {
    return set_double("ost7720_setSineFreq", session, channel, hertz, k_source,
                      within("sine frequency", 0.0, max_sine_freq),
                      [](Channel& c) -> double& { return c.source.sine_freq; });
}

int32_t OST7720_CALL ost7720_getSineFreq(int32_t session, int32_t channel, double* hertz) {
    return get_value("ost7720_getSineFreq", session, channel, hertz, k_source,
                     [](Channel& c) -> double& { return c.source.sine_freq; });
}

int32_t OST7720_CALL ost7720_setSinePhase(int32_t session, int32_t channel, double degrees) {
    return set_double("ost7720_setSinePhase", session, channel, degrees, k_source,
                      within("sine phase", -max_phase, max_phase),
                      [](Channel& c) -> double& { return c.source.sine_phase; });
}

int32_t OST7720_CALL ost7720_getSinePhase(int32_t session, int32_t channel, double* degrees) {
    return get_value("ost7720_getSinePhase", session, channel, degrees, k_source,
                     [](Channel& c) -> double& { return c.source.sine_phase; });
}

int32_t OST7720_CALL ost7720_setSourceSeed(int32_t session, int32_t channel, int32_t seed) {
    return set_source_int("ost7720_setSourceSeed", session, channel, seed, "seed", 0, max_seed,
                          [](Channel& c) -> int32_t& { return c.source.seed; });
}

int32_t OST7720_CALL ost7720_getSourceSeed(int32_t session, int32_t channel, int32_t* seed) {
    return get_value("ost7720_getSourceSeed", session, channel, seed, k_source,
                     [](Channel& c) -> int32_t& { return c.source.seed; });
}

int32_t OST7720_CALL ost7720_setDutyCycle(int32_t session, int32_t channel, double fraction) {
    return set_double("ost7720_setDutyCycle", session, channel, fraction, k_source,
                      within("duty cycle", 0.0, 1.0),
                      [](Channel& c) -> double& { return c.source.duty_cycle; });
}

int32_t OST7720_CALL ost7720_getDutyCycle(int32_t session, int32_t channel, double* fraction) {
    return get_value("ost7720_getDutyCycle", session, channel, fraction, k_source,
                     [](Channel& c) -> double& { return c.source.duty_cycle; });
}

// Arbitrary waveform buffer

int32_t OST7720_CALL ost7720_setAmpScale(int32_t session, int32_t channel, double scale) {
    return set_double("ost7720_setAmpScale", session, channel, scale, k_source,
                      within("amplitude scale", 0.0, 1.0),
                      [](Channel& c) -> double& { return c.source.amp_scale; });
}

int32_t OST7720_CALL ost7720_setSourceBlocksize(int32_t session, int32_t channel, int32_t blocksize) {
    Api api("ost7720_setSourceBlocksize", session,
            {trace_int(session), trace_int(channel), trace_int(blocksize)});
    if (api.injected())
        return api.status();
    std::vector<Channel*> chans;
    if (!api.resolve(session, channel, k_source, chans))
        return api.status();
    if (blocksize <= 0 || blocksize > max_source_blocksize)
        return api.refuse(err_invalid_value, "source block size " + std::to_string(blocksize) +
                                                 " not in 1.." + std::to_string(max_source_blocksize));
    int32_t size = min_blocksize;
    while (size < blocksize)
        size *= 2;
    for (Channel* c : chans)
        c->source.blocksize = size;
    return api.done();
}

int32_t OST7720_CALL ost7720_setSrcBufferSize(int32_t session, int32_t channel, int32_t size) {
    return set_source_int("ost7720_setSrcBufferSize", session, channel, size, "buffer size", 1,
                          max_source_blocksize, [](Channel& c) -> int32_t& { return c.source.buffer_size; });
}

int32_t OST7720_CALL ost7720_setSrcBufferMode(int32_t session, int32_t channel, int32_t mode) {
    return set_code("ost7720_setSrcBufferMode", session, channel, mode, k_source, {1, 2, 3, 4}, "buffer mode",
                    [](Channel& c) -> int32_t& { return c.source.buffer_mode; });
}

// Initialising (1) empties the buffer and restarts its readiness count; 0 leaves it as it is.
int32_t OST7720_CALL ost7720_setSrcBufferInit(int32_t session, int32_t channel, int32_t init) {
    Api api("ost7720_setSrcBufferInit", session, {trace_int(session), trace_int(channel), trace_int(init)});
    if (api.injected())
        return api.status();
    std::vector<Channel*> chans;
    if (!api.resolve(session, channel, k_source, chans))
        return api.status();
    if (init != 0 && init != 1)
        return api.refuse(err_invalid_code, "init code " + std::to_string(init) + " unknown");
    for (Channel* c : chans) {
        c->source.buffer_init = init;
        if (init == 1) {
            c->source.arb_polls = 0;
            c->source.arb_table.clear();
        }
    }
    return api.done();
}

int32_t OST7720_CALL ost7720_checkSrcArbRdy(int32_t session, int32_t channel, int32_t mode, int32_t* ready) {
    Api api("ost7720_checkSrcArbRdy", session, {trace_int(session), trace_int(channel), trace_int(mode)});
    if (api.injected())
        return api.status();
    Channel* c = one_source(api, session, channel);
    if (!c || !check_buffer_mode(api, mode) || !api.not_null(ready, "ready"))
        return api.status();
    if (c->source.buffer_init != 1)
        return api.refuse(err_source_not_ready, "buffer of channel " + std::to_string(channel) +
                                                    " not initialised (ost7720_setSrcBufferInit 1)");
    if (c->source.arb_polls < state().arb_ready_polls)
        ++c->source.arb_polls;
    *ready = c->source.arb_polls >= state().arb_ready_polls ? 1 : 0;
    api.out(*ready);
    return api.done();
}

int32_t OST7720_CALL ost7720_writeSrcBufferData(int32_t session, int32_t channel, const int32_t* data,
                                                int32_t count, int32_t mode) {
    Api api("ost7720_writeSrcBufferData", session,
            {trace_int(session), trace_int(channel), trace_array(data, count), trace_int(count),
             trace_int(mode)});
    if (api.injected())
        return api.status();
    Channel* c = one_source(api, session, channel);
    if (!c || !check_buffer_mode(api, mode))
        return api.status();
    if (count < 1 || count > c->source.buffer_size)
        return api.refuse(err_invalid_count, "count " + std::to_string(count) + " not in 1.." +
                                                 std::to_string(c->source.buffer_size) + " (buffer size)");
    if (!api.not_null(data, "data"))
        return api.status();
    if (c->source.buffer_init != 1 || c->source.arb_polls < state().arb_ready_polls)
        return api.refuse(err_source_not_ready, "buffer of channel " + std::to_string(channel) +
                                                    " not ready; poll ost7720_checkSrcArbRdy first");
    c->source.arb_table.assign(data, data + count);
    return api.done();
}

}  // extern "C"
