// Helpers shared by the simulator tests.
#pragma once

#include <cstdlib>
#include <optional>
#include <string>

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
