// Start-up: finding and probing the modules, and the session over the modules in use.
#pragma once

#include <cstdint>
#include <string>

// Finds every module, probes each (channel counts, memory) with the splash in the main
// window's place; ends the program when none is found or one fails to initialise.
void find_modules();

// Closes any open session and opens one over the modules in use, with channel lists and groups.
void open_session();

// Memory text of the module at a logical address: " 8 MByte", or "unknown".
std::string module_memory_text(int32_t address);

[[noreturn]] void show_no_modules();
[[noreturn]] void show_init_error(const std::string& text);
