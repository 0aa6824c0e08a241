// Helpers shared by the simulator tests.
#pragma once

#include <gtest/gtest.h>

#include <cstdlib>
#include <cstring>
#include <optional>
#include <string>
#include <vector>

#include "errors.h"
#include "ost7720.h"
#include "sim_control.h"

namespace simtest {

// The details of a session's last error, as the panel reads them.
inline std::string details(int32_t session) {
    char buf[256];
    ost7720_errorDetails(session, buf, sizeof buf);
    return buf;
}

// Opens the default system with module 16 first, as the panel's resource list does.
inline int32_t open_both() {
    int32_t s = 0;
    ost7720_init("VXI0::16,8::INSTR", 1, 1, &s);
    return s;
}

// Total, input, source and tachometer channel counts of a session.
inline std::vector<int32_t> channel_counts(int32_t s) {
    int32_t total = -1, inputs = -1, sources = -1, tachs = -1;
    EXPECT_EQ(ost7720_getNumChans(s, &total, &inputs, &sources, &tachs), 0) << details(s);
    return {total, inputs, sources, tachs};
}

// One setting of a channel; the read itself must succeed.
template <class T>
T get(int32_t (*getter)(int32_t, int32_t, T*), int32_t s, int32_t channel) {
    T v{};
    EXPECT_EQ(getter(s, channel, &v), 0) << details(s);
    return v;
}

// What ost7720_find reports; address slots and name bytes it does not write keep -7 and '#'.
struct Found {
    int32_t status = 0;
    int32_t count = -1;
    std::vector<int32_t> addresses = std::vector<int32_t>(60, -7);
    std::string iface;
    bool iface_tail_untouched = true;
    std::vector<int32_t> head(size_t n) const { return {addresses.begin(), addresses.begin() + n}; }
};

inline Found find(int32_t max_modules = 50) {
    Found f;
    char iface[60];
    std::memset(iface, '#', sizeof iface);
    f.status = ost7720_find(0, f.addresses.data(), max_modules, &f.count, iface, 10);
    if (f.status == 0) {
        f.iface.assign(iface, strnlen(iface, sizeof iface));
        for (size_t i = f.iface.size() + 1; i < sizeof iface; ++i)
            f.iface_tail_untouched = f.iface_tail_untouched && iface[i] == '#';
    }
    return f;
}

// Sets an environment variable for the life of the guard, then restores the old state.
class EnvVar {
  public:
    EnvVar(const char* name, const char* value) : name_(name) {
        if (const char* old = std::getenv(name))
            old_ = old;
        if (value)
            setenv(name, value, 1);
        else
            unsetenv(name);
    }
    ~EnvVar() {
        if (old_)
            setenv(name_.c_str(), old_->c_str(), 1);
        else
            unsetenv(name_.c_str());
    }
    EnvVar(const EnvVar&) = delete;
    EnvVar& operator=(const EnvVar&) = delete;

  private:
    std::string name_;
    std::optional<std::string> old_;
};

}  // namespace simtest
