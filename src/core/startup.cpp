#include "core/startup.h"

#include <algorithm>
#include <array>

#include "core/GreetFrm.h"
#include "core/dialogs.h"
#include "core/global.h"
#include "core/number_text.h"
#include "core/shutdown.h"
#include "core/windows.h"
#include "ost7720.h"
#include "pages/resource_list.h"

namespace {

constexpr int32_t max_modules = 50;
constexpr int hw_record_longs = 27;
constexpr int hw_memory_field = 25;
constexpr double bytes_per_mb_unit = 262144.0;

// The characters before the first NUL, scanning no further than the buffer's last character.
std::string text_before_nul(const std::string& buffer) {
    size_t stop = buffer.find('\0');
    if (stop == std::string::npos)
        stop = buffer.empty() ? 0 : buffer.size() - 1;
    return buffer.substr(0, stop);
}

std::string rtrim_blanks(std::string s) {
    s.erase(s.find_last_not_of(' ') + 1);
    return s;
}

using InitCall = int32_t (*)(const char*, int16_t, int16_t, int32_t*);

void init_stage(InitCall call, const std::string& resource, int32_t& handle, std::string& error_buffer) {
    global::status = call(resource.c_str(), 1, 1, &handle);
    if (global::status != 0) {
        global::status = ost7720_error_message(handle, global::status, error_buffer.data());
        show_init_error(text_before_nul(error_buffer));
    }
}

void probe_module(int32_t k, std::string& error_buffer) {
    using namespace global;
    const int32_t address = module_address[k];
    const std::string resource = interface_name + "::" + std::to_string(address) + "::INSTR";
    int32_t handle = 0;
    init_stage(ost7720_initA, resource, handle, error_buffer);
    init_stage(ost7720_initB3, resource, handle, error_buffer);
    init_stage(ost7720_initC, resource, handle, error_buffer);

    int32_t total = 0, inputs = 0, sources = 0, tachs = 0;
    status = ost7720_getNumChans(handle, &total, &inputs, &sources, &tachs);
    driver_ok("ost7720_getNumChans");
    module_inputs[k] = inputs;
    module_sources[k] = sources;
    module_tachs[k] = tachs;
    module_memory[k] = module_memory_text(address);
    status = ost7720_close(handle);
    module_use[k] = flag_true;
}

}  // namespace

void find_modules() {
    using namespace global;
    module_address.assign(max_modules + 1, 0);
    Form& main = forms::main_form();
    GreetFrm& splash = forms::get<GreetFrm>();
    switch_page(main, splash);

    int32_t count = 0;
    std::string name_buffer(50, ' ');
    status = ost7720_find(0, module_address.data(), max_modules, &count, name_buffer.data(), 10);
    if (status != 0 || count < 1)
        show_no_modules();
    // A driver that claims more modules than it may list cannot be trusted beyond the list.
    count = std::min(count, max_modules);
    interface_name = text_before_nul(name_buffer);

    module_address.resize(count + 1);
    module_inputs.assign(count + 1, 0);
    module_sources.assign(count + 1, 0);
    module_tachs.assign(count + 1, 0);
    module_memory.assign(count + 1, std::string());
    module_use.assign(count + 1, flag_false);
    std::string error_buffer(250, ' ');
    module_count = count;

    for (int32_t k = 0; k < count; ++k)
        probe_module(k, error_buffer);
    switch_page(splash, main);
}

std::string module_memory_text(int32_t address) {
    std::array<int32_t, hw_record_longs> record{};
    const int32_t addresses[1] = {address};
    global::status = ost7720_getHWConfig(global::session, 1, addresses, record.data());
    if (global::status != 0)
        return "unknown";
    return numtext::str(record[hw_memory_field] / bytes_per_mb_unit) + " MByte";
}

void open_session() {
    using namespace global;
    if (session != 0) {
        status = ost7720_close(session);
        driver_ok("ost7720_close");
        session = 0;
    }
    group_all = group_inputs = group_sources = group_tachs = 0;

    const std::string list = getRscsString();
    if (list.size() > 1) {
        status = ost7720_init(list.c_str(), 1, 1, &session);
        driver_ok("ost7720_init");
        int32_t total = 0, inputs = 0, sources = 0, tachs = 0;
        status = ost7720_getNumChans(session, &total, &inputs, &sources, &tachs);
        driver_ok("ost7720_getNumChans");
        // Counts come from the driver: never let a negative one or a total smaller than the
        // parts size an array that the loops below then overrun.
        inputs = std::max(inputs, 0);
        sources = std::max(sources, 0);
        tachs = std::max(tachs, 0);
        total = std::max(total, inputs + sources + tachs);
        all_ids.assign(total + 1, 0);
        input_ids.assign(inputs + 1, 0);
        source_ids.assign(sources + 1, 0);
        tach_ids.assign(tachs + 1, 0);
        size_t n = 0;
        for (int32_t i = 1; i <= inputs; ++i)
            all_ids[n++] = input_ids[i - 1] = i;
        for (int32_t i = 1; i <= sources; ++i)
            all_ids[n++] = source_ids[i - 1] = 4096 + i;
        for (int32_t i = 1; i <= tachs; ++i)
            all_ids[n++] = tach_ids[i - 1] = 8192 + i;
        num_inputs = inputs;
        num_sources = sources;
        num_tachs = tachs;
    } else {
        num_inputs = num_sources = num_tachs = 0;
        all_ids.assign(1, 0);
        input_ids.assign(1, 0);
        source_ids.assign(1, 0);
        tach_ids.assign(1, 0);
    }

    std::string revision(255, ' ');
    std::string second(255, ' ');
    status = ost7720_revision_query(session, revision.data(), second.data());
    driver_ok("ost7720_revision_query");
    driver_revision = rtrim_blanks(revision.substr(0, revision.find('\0')));

    status = ost7720_deleteAllChanGroups(session);
    driver_ok("ost7720_deleteAllChanGroups");

    auto create = [](int32_t count, const std::vector<int32_t>& ids, int32_t& group) {
        status = ost7720_createChannelGroup(session, count, ids.data(), &group);
        driver_ok("ost7720_createChannelGroup");
    };
    create(num_inputs, input_ids, group_inputs);
    create(num_sources, source_ids, group_sources);
    create(num_tachs, tach_ids, group_tachs);
    create(num_tachs + num_inputs + num_sources, all_ids, group_all);
}

namespace {

const char* const rerun_advice =
    "Recheck your configuration and run the resource manager.\r\n"
    "Run this soft front panel again after correcting the problem.\r\n";

}  // namespace

void show_no_modules() {
    dialogs::notice(std::string("No Ostrana K7720A modules can be found in this system.\r\n\r\n") +
                    rerun_advice);
    end_program();
}

void show_init_error(const std::string& text) {
    dialogs::notice("ost7720_init returned error: " + text.substr(0, text.find('\0')) + "\r\n\r\n" +
                    rerun_advice);
    end_program();
}
