// Fuzz target: the simulator's parser of OST7720_SIM_MODULES.
//
// Any text: no crash, no read past it, and a one-line printable reason on refusal (the caller
// then ignores the modules). A text it accepts must describe a system that passes the simulator's own checks,
// each field must be the decimal digits of the value it gave (leading zeros aside), and writing
// the modules out again must parse to the same modules.
#include <algorithm>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <string>
#include <string_view>
#include <vector>

#include "parse.h"

namespace {

[[noreturn]] void fail(const char* what, std::string_view text, const std::string& detail) {
    std::fprintf(stderr, "%s: text \"%.*s\": %s\n", what,
                 static_cast<int>(std::min<size_t>(text.size(), 200)), text.data(), detail.c_str());
    std::abort();
}

std::string write_out(const std::vector<sim::ModuleSpec>& modules) {
    std::string s;
    for (size_t i = 0; i < modules.size(); ++i) {
        const sim::ModuleSpec& m = modules[i];
        s += (i ? "," : "") + std::to_string(m.address) + ":" + std::to_string(m.inputs) + ":" +
             std::to_string(m.sources) + ":" + std::to_string(m.tachs) + ":" + std::to_string(m.megabytes);
    }
    return s;
}

// The text with the leading zeros of every field dropped (a field of zeros keeps one).
std::string without_leading_zeros(std::string_view text) {
    std::string out;
    bool at_field_start = true;
    for (size_t i = 0; i < text.size(); ++i) {
        const char c = text[i];
        if (at_field_start && c == '0' && i + 1 < text.size() && text[i + 1] >= '0' && text[i + 1] <= '9')
            continue;
        out += c;
        at_field_start = c == ':' || c == ',';
    }
    return out;
}

bool same(const std::vector<sim::ModuleSpec>& a, const std::vector<sim::ModuleSpec>& b) {
    return std::equal(a.begin(), a.end(), b.begin(), b.end(),
                      [](const sim::ModuleSpec& x, const sim::ModuleSpec& y) {
                          return x.address == y.address && x.inputs == y.inputs && x.sources == y.sources &&
                                 x.tachs == y.tachs && x.megabytes == y.megabytes;
                      });
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    const std::string owned(reinterpret_cast<const char*>(data), size);
    const std::string_view text(owned.data(), owned.size());
    std::vector<sim::ModuleSpec> modules(3);
    std::string error;
    if (sim::parse_modules(text, modules, error)) {
        if (text.empty() != modules.empty())
            fail("accepted text and module count disagree", text, std::to_string(modules.size()));
        std::string why;
        if (!sim::check_modules(modules, why))
            fail("accepted a system its checks refuse", text, why);
        const std::string out = write_out(modules);
        if (out != without_leading_zeros(text))
            fail("accepted a text that is not the modules it gave", text, out);
        std::vector<sim::ModuleSpec> again;
        if (!sim::parse_modules(out, again, why) || !same(again, modules))
            fail("written-out modules do not parse back", out, why);
    } else {
        if (error.empty() || error.size() > 300)
            fail("refused without a one-line reason", text, error);
        for (char c : error)
            if (static_cast<unsigned char>(c) < 32 || static_cast<unsigned char>(c) > 126)
                fail("reason not printable", text, error);
    }
    return 0;
}
