// Fuzz target: the simulator's resource-string parser.
//
// Any text: no crash, no read past it, and a one-line printable reason on refusal. A text it
// accepts must be exactly the canonical list it stands for ("VXI0::" addresses joined by ","
// "::INSTR"), with 1..50 distinct addresses in 1..255. And the other way round: a canonical list
// built from the input bytes must parse back to the same addresses.
#include <algorithm>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <set>
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

std::string canonical(const std::vector<int32_t>& addresses) {
    std::string s = "VXI0::";
    for (size_t i = 0; i < addresses.size(); ++i)
        s += (i ? "," : "") + std::to_string(addresses[i]);
    return s + "::INSTR";
}

void check_reason(std::string_view text, const std::string& error) {
    if (error.empty())
        fail("refused without a reason", text, "");
    if (error.size() > 300)
        fail("reason too long", text, error);
    for (char c : error)
        if (static_cast<unsigned char>(c) < 32 || static_cast<unsigned char>(c) > 126)
            fail("reason not printable", text, error);
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    // The parser gets a view of exactly these bytes: a copy of just this size lets the address
    // sanitizer catch a read past its end.
    const std::string owned(reinterpret_cast<const char*>(data), size);
    const std::string_view text(owned.data(), owned.size());
    std::vector<int32_t> addresses{99};
    std::string error;
    const sim::ResourceError result = sim::parse_resource(text, addresses, error);
    if (result == sim::ResourceError::none) {
        if (addresses.empty() || addresses.size() > 50)
            fail("accepted a list of the wrong length", text, std::to_string(addresses.size()));
        std::set<int32_t> seen;
        for (int32_t a : addresses)
            if (a < 1 || a > 255 || !seen.insert(a).second)
                fail("accepted a bad address", text, std::to_string(a));
        if (canonical(addresses) != text)
            fail("accepted a text that is not its canonical list", text, canonical(addresses));
    } else {
        if (!addresses.empty())
            fail("refused but left addresses", text, std::to_string(addresses.size()));
        check_reason(text, error);
    }

    // The bytes as a list of addresses: each byte 1..255 once, up to 50 of them.
    std::vector<int32_t> wanted;
    std::set<int32_t> used;
    for (size_t i = 0; i < size && wanted.size() < 50; ++i)
        if (data[i] != 0 && used.insert(data[i]).second)
            wanted.push_back(data[i]);
    if (!wanted.empty()) {
        const std::string list = canonical(wanted);
        std::vector<int32_t> got;
        error.clear();
        if (sim::parse_resource(list, got, error) != sim::ResourceError::none || got != wanted)
            fail("refused or changed a canonical list", list, error);
    }
    return 0;
}
