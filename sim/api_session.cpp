// System, sessions, errors and channel groups.
#include <algorithm>
#include <cstring>

#include "call.h"
#include "ost7720.h"
#include "parse.h"

using namespace sim;

namespace {

constexpr size_t max_resource_length = 1024;
constexpr size_t interface_buffer = 50;
constexpr size_t revision_buffer = 255;
constexpr size_t message_buffer = 256;
constexpr int32_t max_hw_addresses = 255;
constexpr int32_t max_group_members = 65536;
constexpr const char* driver_revision = "ost7720 simulator 1.0.0";
constexpr const char* firmware_revision = "A.02.10 simulated";

// Writes a NUL-terminated text of at most size - 1 characters.
void write_text(char* buffer, size_t size, const std::string& text) {
    if (size == 0)
        return;
    size_t n = std::min(text.size(), size - 1);
    std::memcpy(buffer, text.data(), n);
    buffer[n] = '\0';
}

// The hardware-configuration record of a module; index 25 is the memory size.
void fill_hw_record(const Module& m, int32_t* r) {
    const ModuleSpec& s = m.config;
    const int32_t values[hw_record_longs] = {
        s.address,                     // 0 logical address
        0x0F77,                        // 1 manufacturer id
        0x7720,                        // 2 model code
        772000000 + s.address,         // 3 serial number
        3,                             // 4 hardware revision
        0x0210,                        // 5 firmware revision
        s.inputs,                      // 6 input channels
        s.sources,                     // 7 source channels
        s.tachs,                       // 8 tachometer channels
        s.address / 8 + 1,             // 9 slot
        0xC000 + 64 * s.address,       // 10 A16 register base
        0x200000 * (s.address % 8),    // 11 A24 memory base
        51200,                         // 12 highest sample rate, Sa/s
        20000,                         // 13 highest span, Hz
        24,                            // 14 ADC bits
        24,                            // 15 DAC bits
        7,                             // 16 input ranges
        100,                           // 17 smallest input range, mV
        10000,                         // 18 largest input range, mV
        min_blocksize,                 // 19 smallest block size
        m.largest_blocksize,           // 20 largest block size
        arb_points,                    // 21 arbitrary table points
        20240115,                      // 22 calibration date
        0,                             // 23 self-test result (0 passed)
        385,                           // 24 temperature, 0.1 degC
        s.megabytes * hw_memory_unit,  // 25 memory
        0,                             // 26 reserved
    };
    std::copy(values, values + hw_record_longs, r);
}

// Opens a session; stage 1 to 3 for the staged single-module calls (a later stage continues
// the session the earlier stage opened on the same module, so the three give one handle and one
// close ends it), 3 for a resource list. A non-zero reset puts every channel of the modules
// back to its power-on values; the identity query always passes. On failure the handle is 0.
int32_t open_session(const char* fn, const char* resource, int16_t id_query, int16_t reset, int32_t* session,
                     int stage, bool list) {
    Api api(fn, 0, {trace_text(resource, max_resource_length), trace_int(id_query), trace_int(reset)});
    if (api.injected())
        return api.status();
    if (!api.not_null(session, "session"))
        return api.status();
    *session = 0;
    auto refuse = [&](int32_t status, const std::string& text) {
        api.out(int32_t{0});
        return api.refuse(status, text);
    };
    if (!resource)
        return refuse(err_null_pointer, "resource pointer is null");
    size_t length = strnlen(resource, max_resource_length + 1);
    if (length > max_resource_length)
        return refuse(err_resource_syntax, "resource string too long");
    System& sys = state();
    if (!sys.config_error.empty())
        return refuse(err_configuration, sys.config_error);
    std::vector<int32_t> addresses;
    std::string error;
    ResourceError parsed = parse_resource(std::string_view(resource, length), addresses, error);
    if (parsed == ResourceError::syntax)
        return refuse(err_resource_syntax, error);
    if (parsed == ResourceError::unknown_interface)
        return refuse(err_resource_not_found, error);
    if (!list && addresses.size() != 1)
        return refuse(err_resource_syntax, "opens one module; a resource list needs ost7720_init");
    std::vector<int> modules;
    for (int32_t a : addresses) {
        auto it = std::find_if(sys.modules.begin(), sys.modules.end(),
                               [a](const Module& m) { return m.config.address == a; });
        if (it == sys.modules.end())
            return refuse(err_resource_not_found, "no module at address " + std::to_string(a));
        modules.push_back(static_cast<int>(it - sys.modules.begin()));
    }

    Session* s = nullptr;
    if (stage > 1) {
        for (auto& [handle, open] : sys.sessions) {
            if (open.stage == stage - 1 && open.modules == modules)
                s = &open;
        }
    }
    if (!s) {
        if (sys.sessions.size() >= static_cast<size_t>(max_sessions) || sys.next_handle == INT32_MAX)
            return refuse(err_too_many_sessions, "at most " + std::to_string(max_sessions) + " sessions");
        int32_t handle = sys.next_handle++;
        s = &sys.sessions[handle];
        s->handle = handle;
        s->modules = modules;
        number_channels(*s);
    }
    s->stage = stage;
    if (reset) {
        for (int m : modules) {
            Module& mod = sys.modules[static_cast<size_t>(m)];
            for (auto* list_of : {&mod.inputs, &mod.sources, &mod.tachs})
                for (Channel& ch : *list_of)
                    preset_channel(ch);
        }
    }
    *session = s->handle;
    api.out(s->handle);
    return api.done();
}

}  // namespace

extern "C" {

// Writes at most max_modules addresses, in address order; found is the number written.
int32_t OST7720_CALL ost7720_find(int32_t reserved, int32_t* addresses, int32_t max_modules, int32_t* found,
                                  char* interface_name, int32_t timeout_s) {
    Api api("ost7720_find", 0, {trace_int(reserved), trace_int(max_modules), trace_int(timeout_s)});
    if (api.injected())
        return api.status();
    System& sys = state();
    if (!sys.config_error.empty())
        return api.refuse(err_configuration, sys.config_error);
    if (max_modules < 0)
        return api.refuse(err_invalid_count, "max_modules " + std::to_string(max_modules) + " below 0");
    if (max_modules > 0 && !api.not_null(addresses, "addresses"))
        return api.status();
    if (!api.not_null(found, "found") || !api.not_null(interface_name, "interface_name"))
        return api.status();
    int32_t n = std::min(static_cast<int32_t>(sys.modules.size()), max_modules);
    for (int32_t i = 0; i < n; ++i)
        addresses[i] = sys.modules[static_cast<size_t>(i)].config.address;
    *found = n;
    write_text(interface_name, interface_buffer, sim::interface_name);
    api.out_array(addresses, n);
    api.out(n);
    api.out_text(interface_name, interface_buffer);
    return api.done();
}

int32_t OST7720_CALL ost7720_initA(const char* resource, int16_t id_query, int16_t reset, int32_t* session) {
    return open_session("ost7720_initA", resource, id_query, reset, session, 1, false);
}

int32_t OST7720_CALL ost7720_initB3(const char* resource, int16_t id_query, int16_t reset, int32_t* session) {
    return open_session("ost7720_initB3", resource, id_query, reset, session, 2, false);
}

int32_t OST7720_CALL ost7720_initC(const char* resource, int16_t id_query, int16_t reset, int32_t* session) {
    return open_session("ost7720_initC", resource, id_query, reset, session, 3, false);
}

int32_t OST7720_CALL ost7720_init(const char* resource_list, int16_t id_query, int16_t reset,
                                  int32_t* session) {
    return open_session("ost7720_init", resource_list, id_query, reset, session, 3, true);
}

int32_t OST7720_CALL ost7720_close(int32_t session) {
    Api api("ost7720_close", session, {trace_int(session)});
    if (api.injected())
        return api.status();
    if (!api.session(session))
        return api.status();
    state().sessions.erase(session);
    return api.done();
}

int32_t OST7720_CALL ost7720_getNumChans(int32_t session, int32_t* total, int32_t* inputs, int32_t* sources,
                                         int32_t* tachs) {
    Api api("ost7720_getNumChans", session, {trace_int(session)});
    if (api.injected())
        return api.status();
    Session* s = api.session(session);
    if (!s)
        return api.status();
    if (!api.not_null(total, "total") || !api.not_null(inputs, "inputs") ||
        !api.not_null(sources, "sources") || !api.not_null(tachs, "tachs"))
        return api.status();
    *inputs = static_cast<int32_t>(s->inputs.size());
    *sources = static_cast<int32_t>(s->sources.size());
    *tachs = static_cast<int32_t>(s->tachs.size());
    *total = *inputs + *sources + *tachs;
    for (int32_t v : {*total, *inputs, *sources, *tachs})
        api.out(v);
    return api.done();
}

int32_t OST7720_CALL ost7720_getHWConfig(int32_t session, int32_t count, const int32_t* addresses,
                                         int32_t* records) {
    Api api("ost7720_getHWConfig", session,
            {trace_int(session), trace_int(count), trace_array(addresses, count)});
    if (api.injected())
        return api.status();
    if (session != 0 && !api.session(session))
        return api.status();
    if (count < 0 || count > max_hw_addresses)
        return api.refuse(err_invalid_count, "count " + std::to_string(count) + " not in 0.." +
                                                 std::to_string(max_hw_addresses));
    if (count > 0 && (!api.not_null(addresses, "addresses") || !api.not_null(records, "records")))
        return api.status();
    std::vector<const Module*> modules;
    for (int32_t i = 0; i < count; ++i) {
        const Module* m = find_module(addresses[i]);
        if (!m)
            return api.refuse(err_resource_not_found, "no module at address " + std::to_string(addresses[i]));
        modules.push_back(m);
    }
    for (size_t i = 0; i < modules.size(); ++i)
        fill_hw_record(*modules[i], records + i * hw_record_longs);
    api.out_array(records, int64_t{count} * hw_record_longs);
    return api.done();
}

int32_t OST7720_CALL ost7720_revision_query(int32_t session, char* driver_rev, char* firmware_rev) {
    Api api("ost7720_revision_query", session, {trace_int(session)});
    if (api.injected())
        return api.status();
    if (session != 0 && !api.session(session))
        return api.status();
    if (!api.not_null(driver_rev, "driver_revision") || !api.not_null(firmware_rev, "firmware_revision"))
        return api.status();
    write_text(driver_rev, revision_buffer, driver_revision);
    write_text(firmware_rev, revision_buffer, session != 0 ? firmware_revision : "n/a");
    api.out_text(driver_rev, revision_buffer);
    api.out_text(firmware_rev, revision_buffer);
    return api.done();
}

// Any handle is taken here: the text depends only on the status.
int32_t OST7720_CALL ost7720_error_message(int32_t session, int32_t status, char* message) {
    Api api("ost7720_error_message", session, {trace_int(session), trace_int(status)});
    if (api.injected())
        return api.status();
    if (!api.not_null(message, "message"))
        return api.status();
    write_text(message, message_buffer, status_message(status));
    api.out_text(message, message_buffer);
    return api.done();
}

// An open session gives its own last error; handle 0 or an unknown handle the last error of
// any call, which is where refusals of calls without a valid session leave their details.
int32_t OST7720_CALL ost7720_errorDetails(int32_t session, char* details, int32_t length) {
    Api api("ost7720_errorDetails", session, {trace_int(session), trace_int(length)});
    if (api.injected())
        return api.status();
    if (!api.not_null(details, "details"))
        return api.status();
    if (length < 1)
        return api.refuse(err_invalid_count, "length " + std::to_string(length) + " below 1");
    System& sys = state();
    auto it = sys.sessions.find(session);
    const std::string& text = it != sys.sessions.end() ? it->second.details : sys.details;
    write_text(details, static_cast<size_t>(length), text);
    api.out_text(details, static_cast<size_t>(length));
    return api.done();
}

int32_t OST7720_CALL ost7720_deleteAllChanGroups(int32_t session) {
    Api api("ost7720_deleteAllChanGroups", session, {trace_int(session)});
    if (api.injected())
        return api.status();
    Session* s = api.session(session);
    if (!s)
        return api.status();
    s->groups.clear();
    return api.done();
}

int32_t OST7720_CALL ost7720_createChannelGroup(int32_t session, int32_t count, const int32_t* channels,
                                                int32_t* group) {
    Api api("ost7720_createChannelGroup", session,
            {trace_int(session), trace_int(count), trace_array(channels, count)});
    if (api.injected())
        return api.status();
    Session* s = api.session(session);
    if (!s)
        return api.status();
    if (!api.not_null(group, "group"))
        return api.status();
    if (count < 0 || count > max_group_members)
        return api.refuse(err_invalid_count, "count " + std::to_string(count) + " not in 0.." +
                                                 std::to_string(max_group_members));
    if (count > 0 && !api.not_null(channels, "channels"))
        return api.status();
    System& sys = state();
    if (s->groups.size() >= static_cast<size_t>(max_groups_per_session) || sys.next_group == INT32_MAX)
        return api.refuse(err_too_many_groups,
                          "at most " + std::to_string(max_groups_per_session) + " groups");
    std::vector<int32_t> members;
    for (int32_t i = 0; i < count; ++i) {
        int32_t id = channels[i];
        if (!find_channel(*s, id))
            return api.refuse(err_invalid_channel, "channel " + std::to_string(id) + " is not in session " +
                                                       std::to_string(session));
        if (std::find(members.begin(), members.end(), id) == members.end())
            members.push_back(id);
    }
    int32_t id = sys.next_group++;
    s->groups[id] = std::move(members);
    *group = id;
    api.out(id);
    return api.done();
}

}  // extern "C"
