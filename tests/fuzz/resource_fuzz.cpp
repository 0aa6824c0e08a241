// Fuzz target: the simulator's resource-string parser.
//
// Any text: no crash, no read past it, and a one-line printable reason on refusal, with no
// address left. A text it accepts must be exactly the canonical list it stands for ("VXI0::"
// addresses joined by "," "::INSTR"), with 1..50 distinct addresses in 1..255. And the other way
// round: a canonical list built from the input bytes must parse back to the same addresses.
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
    std::string s;
    for (int32_t a : addresses)
        s += (s.empty() ? "VXI0::" : ",") + std::to_string(a);
    return s + "::INSTR";
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    // A view of exactly libFuzzer's bytes: the address sanitizer catches a read past them.
    const std::string_view text(reinterpret_cast<const char*>(data), size);
    std::vector<int32_t> addresses{99};
    std::string error;
    if (sim::parse_resource(text, addresses, error) == sim::ResourceError::none) {
        const std::set<int32_t> distinct(addresses.begin(), addresses.end());
        if (addresses.empty() || addresses.size() > 50 || distinct.size() != addresses.size() ||
            *distinct.begin() < 1 || *distinct.rbegin() > 255 || canonical(addresses) != text)
            fail("accepted a text that is not a canonical list of 1..50 distinct addresses in 1..255", text,
                 canonical(addresses));
    } else if (!addresses.empty() || error.empty() || error.size() > 300 ||
               std::any_of(error.begin(), error.end(), [](unsigned char c) { return c < 32 || c > 126; })) {
        fail("refused without a one-line printable reason, or left addresses", text, error);
    }

    // The bytes as a list of addresses: each byte 1..255 once, up to 50 of them.
    std::vector<int32_t> wanted, got;
    for (size_t i = 0; i < size && wanted.size() < 50; ++i)
        if (data[i] != 0 && std::find(wanted.begin(), wanted.end(), data[i]) == wanted.end())
            wanted.push_back(data[i]);
    if (!wanted.empty() &&
        (sim::parse_resource(canonical(wanted), got, error) != sim::ResourceError::none || got != wanted))
        fail("refused or changed a canonical list", canonical(wanted), error);
    return 0;
}
