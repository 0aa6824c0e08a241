// The driver's status codes: 0 success, negative errors, positive warnings. Every status the
// simulator returns comes from this table, and ost7720_error_message reads its texts from it.
#pragma once

#include <cstdint>
#include <string>

namespace sim {

enum Status : int32_t {
    ok = 0,
    warn_overrun = 1,  // blockAvailable: a continuous block was overwritten before it was read
    err_invalid_session = -1101,
    err_no_session = -1102,
    err_invalid_channel = -1103,
    err_wrong_channel_type = -1104,
    err_invalid_value = -1105,
    err_invalid_code = -1106,
    err_null_pointer = -1107,
    err_invalid_count = -1108,
    err_resource_syntax = -1201,
    err_resource_not_found = -1202,
    err_configuration = -1203,
    err_too_many_sessions = -1204,
    err_too_many_groups = -1205,
    err_measurement_state = -1301,
    err_no_data = -1302,
    err_data_not_enabled = -1303,
    err_source_not_ready = -1401,
};

// Text of any status, an unknown one included; at most 249 characters.
std::string status_message(int32_t status);

}  // namespace sim
