// Driver error report and the end of the program.
#pragma once

#include <cstdint>
#include <string>

// Shows the driver's text and details for a failed call and asks Yes (go on) or No (end the
// program at once). Returns only on Yes.
void report_driver_error(const std::string& name, int32_t code);

// The check after every driver call: reports global::status under the driver function's name
// when it is not 0 (returning only if the user goes on); true when the call succeeded.
bool driver_ok(const char* name);

// Keeps the text before the first NUL (none: empty), turns control and non-ASCII characters
// into blanks and trims blanks at both ends.
void clean_driver_text(std::string& text);

// Exit and closing the main window: close the session (a failure is reported), then end.
[[noreturn]] void exit_panel();
