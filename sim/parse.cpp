#include "parse.h"

#include <algorithm>
#include <set>

#include "system.h"

namespace sim {

namespace {

// A piece of outside text fit for an error message: quoted, printable, and short.
std::string quoted(std::string_view text) {
    constexpr size_t limit = 40;
    std::string out = "\"";
    for (size_t i = 0; i < text.size() && i < limit; ++i) {
        unsigned char c = static_cast<unsigned char>(text[i]);
        out += (c >= 32 && c <= 126) ? static_cast<char>(c) : '?';
    }
    if (text.size() > limit)
        out += "...";
    out += '"';
    return out;
}

std::vector<std::string_view> split(std::string_view text, char sep) {
    std::vector<std::string_view> parts;
    size_t start = 0;
    while (true) {
        size_t pos = text.find(sep, start);
        if (pos == std::string_view::npos) {
            parts.push_back(text.substr(start));
            return parts;
        }
        parts.push_back(text.substr(start, pos - start));
        start = pos + 1;
    }
}

// Unsigned decimal digits only, at most 9 of them so the value always fits.
bool parse_unsigned(std::string_view text, int32_t& value) {
    if (text.empty() || text.size() > 9)
        return false;
    int32_t v = 0;
    for (char c : text) {
        if (c < '0' || c > '9')
            return false;
        v = v * 10 + (c - '0');
    }
    value = v;
    return true;
}

// An optional minus sign and up to 10 digits, within int32_t.
bool parse_signed(std::string_view text, int32_t& value) {
    bool negative = !text.empty() && text.front() == '-';
    if (negative)
        text.remove_prefix(1);
    if (text.empty() || text.size() > 10)
        return false;
    int64_t v = 0;
    for (char c : text) {
        if (c < '0' || c > '9')
            return false;
        v = v * 10 + (c - '0');
    }
    if (negative)
        v = -v;
    if (v < INT32_MIN || v > INT32_MAX)
        return false;
    value = static_cast<int32_t>(v);
    return true;
}

}  // namespace

bool check_modules(const std::vector<ModuleSpec>& modules, std::string& error) {
    if (modules.size() > static_cast<size_t>(max_modules)) {
        error = std::to_string(modules.size()) + " modules, at most " + std::to_string(max_modules);
        return false;
    }
    std::set<int32_t> seen;
    for (size_t i = 0; i < modules.size(); ++i) {
        const ModuleSpec& m = modules[i];
        std::string which = "module " + std::to_string(i + 1) + ": ";
        auto bad = [&](const char* what, int32_t v, int32_t lo, int32_t hi) {
            error = which + what + " " + std::to_string(v) + " not in " + std::to_string(lo) + ".." +
                    std::to_string(hi);
            return false;
        };
        if (m.address < 1 || m.address > 255)
            return bad("address", m.address, 1, 255);
        if (m.inputs < 0 || m.inputs > max_inputs_per_module)
            return bad("inputs", m.inputs, 0, max_inputs_per_module);
        if (m.sources < 0 || m.sources > max_sources_per_module)
            return bad("sources", m.sources, 0, max_sources_per_module);
        if (m.tachs < 0 || m.tachs > max_tachs_per_module)
            return bad("tachs", m.tachs, 0, max_tachs_per_module);
        if (m.megabytes < 1 || m.megabytes > max_megabytes)
            return bad("megabytes", m.megabytes, 1, max_megabytes);
        if (!seen.insert(m.address).second) {
            error = which + "address " + std::to_string(m.address) + " used twice";
            return false;
        }
    }
    return true;
}

bool parse_modules(std::string_view text, std::vector<ModuleSpec>& modules, std::string& error) {
    modules.clear();
    if (text.empty())
        return true;
    std::vector<std::string_view> entries = split(text, ',');
    if (entries.size() > static_cast<size_t>(max_modules)) {
        error = "more than " + std::to_string(max_modules) + " modules";
        return false;
    }
    for (size_t i = 0; i < entries.size(); ++i) {
        std::vector<std::string_view> fields = split(entries[i], ':');
        std::string which = "module " + std::to_string(i + 1) + " " + quoted(entries[i]) + ": ";
        if (fields.size() != 5) {
            error = which + "expected address:inputs:sources:tachs:megabytes";
            return false;
        }
        int32_t v[5];
        static constexpr const char* names[5] = {"address", "inputs", "sources", "tachs", "megabytes"};
        for (int f = 0; f < 5; ++f) {
            if (!parse_unsigned(fields[f], v[f])) {
                error = which + names[f] + " " + quoted(fields[f]) + " is not a whole number";
                return false;
            }
        }
        modules.push_back({v[0], v[1], v[2], v[3], v[4]});
    }
    if (!check_modules(modules, error)) {
        modules.clear();
        return false;
    }
    return true;
}

ResourceError parse_resource(std::string_view text, std::vector<int32_t>& addresses, std::string& error) {
    addresses.clear();
    if (text.empty()) {
        error = "empty resource string";
        return ResourceError::syntax;
    }
    size_t first = text.find("::");
    size_t last = text.rfind("::");
    if (first == std::string_view::npos || first == last) {
        error = "resource " + quoted(text) + " is not interface::address::INSTR";
        return ResourceError::syntax;
    }
    std::string_view iface = text.substr(0, first);
    std::string_view list = text.substr(first + 2, last - first - 2);
    std::string_view tail = text.substr(last + 2);
    if (tail != "INSTR") {
        error = "resource " + quoted(text) + " does not end in ::INSTR";
        return ResourceError::syntax;
    }
    if (iface != interface_name) {
        error = "unknown interface " + quoted(iface);
        return ResourceError::unknown_interface;
    }
    std::vector<std::string_view> items = split(list, ',');
    if (items.size() > static_cast<size_t>(max_modules)) {
        error = "more than " + std::to_string(max_modules) + " addresses";
        return ResourceError::syntax;
    }
    for (std::string_view item : items) {
        int32_t a = 0;
        bool digits = parse_unsigned(item, a) && !(item.size() > 1 && item.front() == '0');
        if (!digits || a < 1 || a > 255) {
            error = "address " + quoted(item) + " is not a number 1..255";
            addresses.clear();
            return ResourceError::syntax;
        }
        if (std::find(addresses.begin(), addresses.end(), a) != addresses.end()) {
            error = "address " + std::to_string(a) + " repeated";
            addresses.clear();
            return ResourceError::syntax;
        }
        addresses.push_back(a);
    }
    return ResourceError::none;
}

bool parse_failures(std::string_view text, std::vector<FailureSpec>& failures, std::string& error) {
    failures.clear();
    if (text.empty())
        return true;
    for (std::string_view entry : split(text, ',')) {
        std::vector<std::string_view> fields = split(entry, ':');
        if (fields.size() < 2 || fields.size() > 3) {
            error = "failure " + quoted(entry) + ": expected name:status[:count]";
            failures.clear();
            return false;
        }
        const auto& names = function_names();
        if (std::find(names.begin(), names.end(), fields[0]) == names.end()) {
            error = "failure " + quoted(entry) + ": unknown function " + quoted(fields[0]);
            failures.clear();
            return false;
        }
        FailureSpec f;
        f.function = std::string(fields[0]);
        if (!parse_signed(fields[1], f.status)) {
            error = "failure " + quoted(entry) + ": status " + quoted(fields[1]) + " is not a number";
            failures.clear();
            return false;
        }
        if (fields.size() == 3) {
            int32_t count = 0;
            if (!parse_unsigned(fields[2], count) || count < 1) {
                error = "failure " + quoted(entry) + ": count " + quoted(fields[2]) + " is not 1 or more";
                failures.clear();
                return false;
            }
            f.count = count;
        }
        failures.push_back(f);
    }
    return true;
}

const std::vector<std::string>& function_names() {
    static const std::vector<std::string> names = {
        "ost7720_find",
        "ost7720_initA",
        "ost7720_initB3",
        "ost7720_initC",
        "ost7720_init",
        "ost7720_close",
        "ost7720_getNumChans",
        "ost7720_getHWConfig",
        "ost7720_revision_query",
        "ost7720_error_message",
        "ost7720_errorDetails",
        "ost7720_deleteAllChanGroups",
        "ost7720_createChannelGroup",
        "ost7720_setBlocksize",
        "ost7720_getBlocksize",
        "ost7720_setSpan",
        "ost7720_getSpan",
        "ost7720_setDataMode",
        "ost7720_setCalcData",
        "ost7720_setEnable",
        "ost7720_getEnable",
        "ost7720_setAvgMode",
        "ost7720_setAvgNumber",
        "ost7720_setAvgUpdate",
        "ost7720_setWindow",
        "ost7720_setArmMode",
        "ost7720_setAutoTrigger",
        "ost7720_initMeasure",
        "ost7720_armMeasure",
        "ost7720_armMeasureMasterSetup",
        "ost7720_armMeasureSlaveFinish",
        "ost7720_armMeasureMasterFinish",
        "ost7720_triggerMeasure",
        "ost7720_blockAvailable",
        "ost7720_readFloat64Data",
        "ost7720_resetMeasure",
        "ost7720_setActive",
        "ost7720_getActive",
        "ost7720_setRange",
        "ost7720_getRange",
        "ost7720_setTriggerChannel",
        "ost7720_getTriggerChannel",
        "ost7720_preset",
        "ost7720_setCoupling",
        "ost7720_getCoupling",
        "ost7720_setAntiAliasDigital",
        "ost7720_getAntiAliasDigital",
        "ost7720_setInputMode",
        "ost7720_getInputMode",
        "ost7720_setTriggerSlope",
        "ost7720_getTriggerSlope",
        "ost7720_setTriggerMode",
        "ost7720_getTriggerMode",
        "ost7720_setTriggerLevel",
        "ost7720_getTriggerLevel",
        "ost7720_setSourceMode",
        "ost7720_getSourceMode",
        "ost7720_setSourceOutput",
        "ost7720_getSourceOutput",
        "ost7720_setSourceSum",
        "ost7720_getSourceSum",
        "ost7720_setSourceCola",
        "ost7720_getSourceCola",
        "ost7720_setRampRate",
        "ost7720_getRampRate",
        "ost7720_setSineFreq",
        "ost7720_getSineFreq",
        "ost7720_setSinePhase",
        "ost7720_getSinePhase",
        "ost7720_setSourceSeed",
        "ost7720_getSourceSeed",
        "ost7720_setDutyCycle",
        "ost7720_getDutyCycle",
        "ost7720_setAmpScale",
        "ost7720_setSourceBlocksize",
        "ost7720_setSrcBufferSize",
        "ost7720_setSrcBufferMode",
        "ost7720_setSrcBufferInit",
        "ost7720_checkSrcArbRdy",
        "ost7720_writeSrcBufferData",
    };
    return names;
}

}  // namespace sim
