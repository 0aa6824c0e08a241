#include "calllog.h"

#include <charconv>
#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <cstring>

#include "system.h"

namespace sim {

namespace {

// The log is trimmed to its newer half when it reaches this size, so a panel left running
// for days does not grow without bound.
constexpr size_t log_limit = 200000;

std::vector<Call> log_;
std::vector<FailureSpec> failures_;
std::FILE* trace_ = nullptr;

}  // namespace

std::string trace_int(int64_t v) {
    return std::to_string(v);
}

std::string trace_double(double v) {
    char buf[64];
    auto res = std::to_chars(buf, buf + sizeof buf, v);
    return std::string(buf, res.ptr);
}

std::string trace_text(const char* text, size_t max_length) {
    if (!text)
        return "null";
    size_t n = strnlen(text, max_length);
    while (n > 0 && text[n - 1] == ' ')
        --n;
    std::string out = "\"";
    for (size_t i = 0; i < n; ++i) {
        unsigned char c = static_cast<unsigned char>(text[i]);
        if (c == '"' || c == '\\') {
            out += '\\';
            out += static_cast<char>(c);
        } else if (c < 32 || c > 126) {
            char esc[8];
            std::snprintf(esc, sizeof esc, "\\x%02X", c);
            out += esc;
        } else {
            out += static_cast<char>(c);
        }
    }
    out += '"';
    return out;
}

std::string trace_array(const void* data, int64_t count) {
    if (!data)
        return "null";
    return "[" + std::to_string(count) + "]";
}

std::string Call::line() const {
    std::string s = name + "(";
    for (size_t i = 0; i < args.size(); ++i) {
        if (i)
            s += ", ";
        s += args[i];
    }
    s += ") -> " + std::to_string(status);
    if (!outs.empty()) {
        s += " =>";
        for (size_t i = 0; i < outs.size(); ++i)
            s += (i ? ", " : " ") + outs[i];
    }
    return s;
}

void record_call(Call call) {
    if (trace_) {
        std::string line = call.line() + "\n";
        std::fwrite(line.data(), 1, line.size(), trace_);
        std::fflush(trace_);
    }
    if (log_.size() >= log_limit)
        log_.erase(log_.begin(), log_.begin() + log_limit / 2);
    log_.push_back(std::move(call));
}

void open_trace_from_environment() {
    if (trace_) {
        std::fclose(trace_);
        trace_ = nullptr;
    }
    const char* path = std::getenv("OST7720_SIM_TRACE");
    if (path && *path)
        trace_ = std::fopen(path, "a");
}

void reset_call_log() {
    log_.clear();
    failures_.clear();
}

void set_failures(const std::vector<FailureSpec>& failures) {
    failures_ = failures;
}

bool take_failure(const std::string& function, int32_t& status) {
    for (auto it = failures_.begin(); it != failures_.end(); ++it) {
        if (it->function != function)
            continue;
        status = it->status;
        if (it->count > 0 && --it->count == 0)
            failures_.erase(it);
        return true;
    }
    return false;
}

const std::vector<Call>& call_log() {
    state();
    return log_;
}

std::vector<std::string> call_names() {
    std::vector<std::string> names;
    names.reserve(log_.size());
    for (const Call& c : log_)
        names.push_back(c.name);
    return names;
}

void clear_call_log() {
    state();
    log_.clear();
}

void fail(const std::string& function, int32_t status, int count) {
    state();
    if (count == 0)
        return;
    failures_.push_back({function, status, count < 0 ? -1 : count});
}

void clear_failures() {
    state();
    failures_.clear();
}

}  // namespace sim
