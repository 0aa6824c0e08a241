// Fuzz target: the simulator's parser of OST7720_SIM_MODULES.
//
// Any text: no crash, no read past it, and a one-line printable reason on refusal (the caller
// then ignores the modules). A text it accepts must describe a system that passes the simulator's
// own checks, each field must be the decimal digits of the value it gave (leading zeros aside),
// and writing the modules out again must parse to the same modules.
#include <algorithm>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <regex>
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
    for (const sim::ModuleSpec& m : modules) {
        const char* separator = s.empty() ? "" : ",";
        for (int32_t field : {m.address, m.inputs, m.sources, m.tachs, m.megabytes}) {
            s += separator + std::to_string(field);
            separator = ":";
        }
    }
    return s;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    // A view of exactly libFuzzer's bytes: the address sanitizer catches a read past them.
    const std::string_view text(reinterpret_cast<const char*>(data), size);
    std::vector<sim::ModuleSpec> modules(3), again;
    std::string error, why;
    if (!sim::parse_modules(text, modules, error)) {
        if (error.empty() || error.size() > 300 ||
            std::any_of(error.begin(), error.end(), [](unsigned char c) { return c < 32 || c > 126; }))
            fail("refused without a one-line printable reason", text, error);
        return 0;
    }
    if (text.empty() != modules.empty())
        fail("accepted text and module count disagree", text, std::to_string(modules.size()));
    if (!sim::check_modules(modules, why))
        fail("accepted a system its checks refuse", text, why);
    static const std::regex leading_zeros("(^|[:,])0+([0-9])");  // a field of zeros keeps one
    const std::string out = write_out(modules);
    if (out != std::regex_replace(std::string(text), leading_zeros, "$1$2"))
        fail("accepted a text that is not the modules it gave", text, out);
    if (!sim::parse_modules(out, again, why) || write_out(again) != out)
        fail("written-out modules do not parse back", out, why);
    return 0;
}
