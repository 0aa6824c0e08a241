// One driver call in progress: logs it when it ends, applies injected failures, and holds the
// checks every entry point shares (session handle, channel or group id, channel type).
#pragma once

#include <algorithm>
#include <cstdint>
#include <initializer_list>
#include <string>
#include <vector>

#include "calllog.h"
#include "errors.h"
#include "system.h"

namespace sim {

// Which kinds of channel a setting applies to.
enum Kinds : unsigned { k_input = 1, k_source = 2, k_tach = 4, k_any = 7 };

class Api {
  public:
    // handle: the session argument of the call (0 when it has none).
    Api(const char* name, int32_t handle, std::vector<std::string> args);
    ~Api();
    Api(const Api&) = delete;
    Api& operator=(const Api&) = delete;

    bool injected() const { return injected_; }
    int32_t status() const { return call_.status; }
    const std::string& name() const { return call_.name; }

    // Refuses the call: the status, and details "<function>: <text>" for ost7720_errorDetails.
    int32_t refuse(int32_t status, const std::string& text);
    int32_t done(int32_t status = ok) {
        call_.status = status;
        return status;
    }

    void out(int32_t v) { call_.outs.push_back(trace_int(v)); }
    void out(double v) { call_.outs.push_back(trace_double(v)); }
    void out_text(const char* text, size_t max_length) { call_.outs.push_back(trace_text(text, max_length)); }
    void out_array(const void* data, int64_t count) { call_.outs.push_back(trace_array(data, count)); }

    // The open session of the handle, or nullptr after refusing the call.
    Session* session(int32_t handle);
    // The channels a call addresses: one channel, or every member of a group. A getter reads
    // the first member, so for it an empty group is refused.
    bool targets(Session& s, int32_t id, unsigned kinds, std::vector<Channel*>& channels,
                 bool need_one = false);
    // Both of the above in one step.
    bool resolve(int32_t handle, int32_t id, unsigned kinds, std::vector<Channel*>& channels,
                 bool need_one = false);
    bool not_null(const void* p, const char* what);

  private:
    Call call_;
    int32_t handle_;
    bool injected_ = false;
};

const char* kind_name(ChannelKind k);

// Setting and reading an enumerated code on channels or groups.
template <class Field>
int32_t set_code(const char* fn, int32_t handle, int32_t id, int32_t value, unsigned kinds,
                 std::initializer_list<int32_t> allowed, const char* what, Field field) {
    Api api(fn, handle, {trace_int(handle), trace_int(id), trace_int(value)});
    if (api.injected())
        return api.status();
    std::vector<Channel*> chans;
    if (!api.resolve(handle, id, kinds, chans))
        return api.status();
    if (std::find(allowed.begin(), allowed.end(), value) == allowed.end())
        return api.refuse(err_invalid_code,
                          std::string(what) + " code " + std::to_string(value) + " unknown");
    for (Channel* c : chans)
        field(*c) = value;
    return api.done();
}

template <class T, class Field>
int32_t get_value(const char* fn, int32_t handle, int32_t id, T* value, unsigned kinds, Field field) {
    Api api(fn, handle, {trace_int(handle), trace_int(id)});
    if (api.injected())
        return api.status();
    std::vector<Channel*> chans;
    if (!api.resolve(handle, id, kinds, chans, true))
        return api.status();
    if (!api.not_null(value, "value"))
        return api.status();
    *value = field(*chans.front());
    api.out(*value);
    return api.done();
}

// Setting a double: check returns an error text (empty when the value is taken) and may
// coerce the value.
template <class Check, class Field>
int32_t set_double(const char* fn, int32_t handle, int32_t id, double value, unsigned kinds, Check check,
                   Field field) {
    Api api(fn, handle, {trace_int(handle), trace_int(id), trace_double(value)});
    if (api.injected())
        return api.status();
    std::vector<Channel*> chans;
    if (!api.resolve(handle, id, kinds, chans))
        return api.status();
    for (Channel* c : chans) {
        double v = value;
        std::string error = check(*c, v);
        if (!error.empty())
            return api.refuse(err_invalid_value, error);
    }
    for (Channel* c : chans) {
        double v = value;
        check(*c, v);
        field(*c) = v;
    }
    return api.done();
}

}  // namespace sim
