#include "call.h"

namespace sim {

Api::Api(const char* name, int32_t handle, std::vector<std::string> args) : handle_(handle) {
    state();  // powers on before the first call
    call_.name = name;
    call_.args = std::move(args);
    int32_t status = 0;
    if (take_failure(call_.name, status)) {
        injected_ = true;
        refuse(status, "simulated failure (status " + std::to_string(status) + ")");
    }
}

Api::~Api() {
    record_call(std::move(call_));
}

int32_t Api::refuse(int32_t status, const std::string& text) {
    call_.status = status;
    std::string details = call_.name + ": " + text;
    System& sys = state();
    sys.details = details;
    auto it = sys.sessions.find(handle_);
    if (it != sys.sessions.end())
        it->second.details = details;
    return status;
}

Session* Api::session(int32_t handle) {
    if (handle == 0) {
        refuse(err_no_session, "session handle 0: no session is open");
        return nullptr;
    }
    System& sys = state();
    auto it = sys.sessions.find(handle);
    if (it == sys.sessions.end()) {
        refuse(err_invalid_session, "session " + std::to_string(handle) + " is not open");
        return nullptr;
    }
    return &it->second;
}

const char* kind_name(ChannelKind k) {
    return k == ChannelKind::input ? "an input" : k == ChannelKind::source ? "a source" : "a tachometer";
}

namespace {

std::string allowed_kinds(unsigned kinds) {
    std::string s;
    auto add = [&](unsigned bit, const char* n) {
        if (!(kinds & bit))
            return;
        if (!s.empty())
            s += " or ";
        s += n;
    };
    add(k_input, "inputs");
    add(k_source, "sources");
    add(k_tach, "tachometers");
    return s;
}

}  // namespace

bool Api::targets(Session& s, int32_t id, unsigned kinds, std::vector<Channel*>& channels, bool need_one) {
    channels.clear();
    std::vector<int32_t> ids;
    auto group = s.groups.find(id);
    if (group != s.groups.end()) {
        ids = group->second;
        if (need_one && ids.empty()) {
            refuse(err_invalid_channel, "group " + std::to_string(id) + " is empty");
            return false;
        }
    } else {
        ids.push_back(id);
    }
    for (int32_t member : ids) {
        const ChannelRef* ref = find_channel(s, member);
        if (!ref) {
            refuse(err_invalid_channel,
                   "channel " + std::to_string(member) + " is not in session " + std::to_string(s.handle));
            return false;
        }
        unsigned bit = ref->kind == ChannelKind::input    ? k_input
                       : ref->kind == ChannelKind::source ? k_source
                                                          : k_tach;
        if (!(kinds & bit)) {
            refuse(err_wrong_channel_type, "channel " + std::to_string(member) + " is " +
                                               kind_name(ref->kind) + "; the call takes " +
                                               allowed_kinds(kinds));
            return false;
        }
        channels.push_back(&channel_at(*ref));
        if (need_one)
            break;
    }
    return true;
}

bool Api::resolve(int32_t handle, int32_t id, unsigned kinds, std::vector<Channel*>& channels,
                  bool need_one) {
    Session* s = session(handle);
    return s && targets(*s, id, kinds, channels, need_one);
}

bool Api::not_null(const void* p, const char* what) {
    if (p)
        return true;
    refuse(err_null_pointer, std::string(what) + " pointer is null");
    return false;
}

}  // namespace sim
