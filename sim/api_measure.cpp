// Measurement control: start, multi-mainframe arming, trigger, block poll and read, reset.
#include "call.h"
#include "measure.h"
#include "ost7720.h"
#include "signals.h"

using namespace sim;

namespace {

std::vector<int32_t> member_ids(Session& s, int32_t id) {
    auto g = s.groups.find(id);
    if (g != s.groups.end())
        return g->second;
    return {id};
}

// One channel (not a group) of the session, of the kinds given.
Channel* single_channel(Api& api, Session& s, int32_t id, unsigned kinds, const char* role) {
    if (s.groups.count(id)) {
        api.refuse(err_invalid_channel,
                   std::string(role) + " " + std::to_string(id) + " is a group, not a channel");
        return nullptr;
    }
    std::vector<Channel*> chans;
    if (!api.targets(s, id, kinds, chans, true))
        return nullptr;
    return chans.front();
}

const char* step_name(ArmStep step) {
    switch (step) {
        case ArmStep::none:
            return "initMeasure";
        case ArmStep::master_setup:
            return "armMeasureMasterSetup";
        case ArmStep::armed:
            return "armMeasure";
        case ArmStep::slave_finished:
            return "armMeasureSlaveFinish";
        case ArmStep::master_finished:
            return "armMeasureMasterFinish";
    }
    return "";
}

// Multi-mainframe arming goes initMeasure (arm mode 430), master set-up, arm, slave finish,
// master finish; each step is taken only right after the one before it.
int32_t arm_step(Api& api, Session& s, ArmStep from, ArmStep to) {
    Measurement& m = s.measurement;
    if (!m.started)
        return api.refuse(err_measurement_state, "no measurement: call ost7720_initMeasure first");
    if (!m.multi_mainframe)
        return api.refuse(err_measurement_state, "the measurement was not started with arm mode 430");
    if (m.arm != from)
        return api.refuse(err_measurement_state,
                          std::string("must follow ") + step_name(from) + ", not " + step_name(m.arm));
    m.arm = to;
    if (to == ArmStep::master_finished)
        start_running(m, now_seconds());
    return api.done();
}

}  // namespace

extern "C" {

int32_t OST7720_CALL ost7720_initMeasure(int32_t session, int32_t channel) {
    Api api("ost7720_initMeasure", session, {trace_int(session), trace_int(channel)});
    if (api.injected())
        return api.status();
    Session* s = api.session(session);
    std::vector<Channel*> chans;
    if (!s || !api.targets(*s, channel, k_any, chans))
        return api.status();
    start_measurement(*s, member_ids(*s, channel), now_seconds());
    return api.done();
}

int32_t OST7720_CALL ost7720_armMeasure(int32_t session, int32_t channel, int32_t reserved) {
    Api api("ost7720_armMeasure", session, {trace_int(session), trace_int(channel), trace_int(reserved)});
    if (api.injected())
        return api.status();
    Session* s = api.session(session);
    std::vector<Channel*> chans;
    if (!s || !api.targets(*s, channel, k_any, chans))
        return api.status();
    return arm_step(api, *s, ArmStep::master_setup, ArmStep::armed);
}

namespace {

// One arming step addressed to a single channel (the master or the slave).
int32_t arm_on_channel(const char* name, int32_t session, int32_t channel, const char* role, ArmStep from,
                       ArmStep to) {
    Api api(name, session, {trace_int(session), trace_int(channel)});
    if (api.injected())
        return api.status();
    Session* s = api.session(session);
    if (!s || !single_channel(api, *s, channel, k_any, role))
        return api.status();
    return arm_step(api, *s, from, to);
}

}  // namespace

int32_t OST7720_CALL ost7720_armMeasureMasterSetup(int32_t session, int32_t master) {
    return arm_on_channel("ost7720_armMeasureMasterSetup", session, master, "master", ArmStep::none,
                          ArmStep::master_setup);
}

int32_t OST7720_CALL ost7720_armMeasureSlaveFinish(int32_t session, int32_t slave) {
    return arm_on_channel("ost7720_armMeasureSlaveFinish", session, slave, "slave", ArmStep::armed,
                          ArmStep::slave_finished);
}

int32_t OST7720_CALL ost7720_armMeasureMasterFinish(int32_t session, int32_t master) {
    return arm_on_channel("ost7720_armMeasureMasterFinish", session, master, "master",
                          ArmStep::slave_finished, ArmStep::master_finished);
}

int32_t OST7720_CALL ost7720_triggerMeasure(int32_t session, int32_t channel, int32_t reserved) {
    Api api("ost7720_triggerMeasure", session, {trace_int(session), trace_int(channel), trace_int(reserved)});
    if (api.injected())
        return api.status();
    Session* s = api.session(session);
    std::vector<Channel*> chans;
    if (!s || !api.targets(*s, channel, k_any, chans))
        return api.status();
    Measurement& m = s->measurement;
    if (!m.started)
        return api.refuse(err_measurement_state, "no measurement is running");
    double now = now_seconds();
    advance(*s, now);  // triggers that came before this one keep their place
    m.manual_pending = true;
    m.manual_time = now;
    return api.done();
}

// The number of complete blocks every measuring channel addressed has still to read; status 1
// (a warning) when one of them lost blocks it had not read.
int32_t OST7720_CALL ost7720_blockAvailable(int32_t session, int32_t channel, int32_t* available) {
    Api api("ost7720_blockAvailable", session, {trace_int(session), trace_int(channel)});
    if (api.injected())
        return api.status();
    Session* s = api.session(session);
    std::vector<Channel*> chans;
    if (!s || !api.targets(*s, channel, k_any, chans))
        return api.status();
    if (!api.not_null(available, "available"))
        return api.status();
    advance(*s, now_seconds());
    bool overrun = false;
    int64_t n = available_blocks(*s, member_ids(*s, channel), overrun);
    *available = static_cast<int32_t>(std::min<int64_t>(n, INT32_MAX));
    api.out(*available);
    return api.done(overrun ? warn_overrun : ok);
}

// Reads the channel's next block: time data (345, block size values, volts) or frequency data
// (346, block size / 2 magnitudes of the Hann-windowed block). Fewer values than the block holds
// may be asked for; the wait argument (0 or 1) is accepted, and a block that is not complete is
// refused either way.
int32_t OST7720_CALL ost7720_readFloat64Data(int32_t session, int32_t channel, int32_t data_type,
                                             double* data, int32_t count, int32_t* actual, int32_t wait) {
    Api api(
        "ost7720_readFloat64Data", session,
        {trace_int(session), trace_int(channel), trace_int(data_type), trace_int(count), trace_int(wait)});
    if (api.injected())
        return api.status();
    Session* s = api.session(session);
    if (!s)
        return api.status();
    Channel* ch = single_channel(api, *s, channel, k_input, "channel");
    if (!ch)
        return api.status();
    if (data_type != code::read_time && data_type != code::read_frequency)
        return api.refuse(err_invalid_code, "data type code " + std::to_string(data_type) + " unknown");
    if (wait != 0 && wait != 1)
        return api.refuse(err_invalid_code, "wait code " + std::to_string(wait) + " unknown");
    if (count < 0)
        return api.refuse(err_invalid_count, "count " + std::to_string(count) + " below 0");
    if ((count > 0 && !api.not_null(data, "data")) || !api.not_null(actual, "actual"))
        return api.status();
    Measurement& m = s->measurement;
    const double now = now_seconds();
    advance(*s, now);
    if (!m.cursor.count(channel))
        return api.refuse(err_no_data, "channel " + std::to_string(channel) + " is not measuring");
    bool overrun = false;
    if (available_blocks(*s, {channel}, overrun) < 1)
        return api.refuse(err_no_data, "no block of channel " + std::to_string(channel) + " is available");
    const bool time = data_type == code::read_time;
    if ((time ? ch->measure.enable_time : ch->measure.enable_frequency) != code::enable_on)
        return api.refuse(err_data_not_enabled, std::string(time ? "time" : "frequency") +
                                                    " data of channel " + std::to_string(channel) +
                                                    " is not enabled");
    const int32_t values = time ? m.blocksize : m.blocksize / 2;
    if (count > values)
        return api.refuse(err_invalid_count, "count " + std::to_string(count) + " above the " +
                                                 std::to_string(values) + " values of the block");
    std::vector<double> block;
    take_block(*s, channel, now, block);
    if (!time) {
        std::vector<double> spectrum(block.size() / 2);
        signals::magnitude_spectrum(block, spectrum);
        block.swap(spectrum);
    }
    std::copy(block.begin(), block.begin() + count, data);
    *actual = count;
    api.out_array(data, count);
    api.out(count);
    return api.done();
}

int32_t OST7720_CALL ost7720_resetMeasure(int32_t session, int32_t channel) {
    Api api("ost7720_resetMeasure", session, {trace_int(session), trace_int(channel)});
    if (api.injected())
        return api.status();
    Session* s = api.session(session);
    std::vector<Channel*> chans;
    if (!s || !api.targets(*s, channel, k_any, chans))
        return api.status();
    s->measurement = Measurement{};
    return api.done();
}

}  // extern "C"
