#include "errors.h"

#include <array>

namespace sim {

namespace {

struct Entry {
    int32_t status;
    const char* text;
};

constexpr std::array<Entry, 19> table{{
    {ok, "No error"},
    {warn_overrun, "Warning: a data block was overwritten before it was read"},
    {err_invalid_session, "Invalid session handle"},
    {err_no_session, "The call needs an open session"},
    {err_invalid_channel, "Invalid channel or group id"},
    {err_wrong_channel_type, "The setting does not apply to this type of channel"},
    {err_invalid_value, "Parameter value out of range"},
    {err_invalid_code, "Unknown setting code"},
    {err_null_pointer, "Null pointer argument"},
    {err_invalid_count, "Invalid count or buffer length"},
    {err_resource_syntax, "Invalid resource string"},
    {err_resource_not_found, "No module at the resource given"},
    {err_configuration, "Invalid simulated system configuration"},
    {err_too_many_sessions, "Too many open sessions"},
    {err_too_many_groups, "Too many channel groups"},
    {err_measurement_state, "The measurement is not in the state this call needs"},
    {err_no_data, "No data block available"},
    {err_data_not_enabled, "This kind of data is not enabled"},
    {err_source_not_ready, "The arbitrary source buffer is not ready"},
}};

}  // namespace

std::string status_message(int32_t status) {
    for (const Entry& e : table) {
        if (e.status == status)
            return e.text;
    }
    if (status > 0)
        return "Unknown warning code " + std::to_string(status);
    return "Unknown error code " + std::to_string(status);
}

}  // namespace sim
