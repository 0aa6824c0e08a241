#include <string>
#include <vector>

#include "core/dialogs.h"
#include "core/global.h"
#include "core/shutdown.h"
#include "measure/measurement.h"
#include "ost7720.h"
#include "ost7720_codes.h"

namespace {

// True when some channel of the list (count entries) is set to trigger. Every channel is asked.
bool any_set_to_trigger(const std::vector<int32_t>& ids, int32_t count) {
    bool any = false;
    for (int32_t i = 0; i < count && static_cast<size_t>(i) < ids.size(); ++i) {
        int32_t state = 0;
        global::status = ost7720_getTriggerChannel(global::session, ids[i], &state);
        driver_ok("ost7720_getTriggerChannel");
        if (state == ost7720_code::on)
            any = true;
    }
    return any;
}

const char* const crlf = "\r\n";

std::string warning(const std::string& selected, const std::string& but, const std::string& advice,
                    bool blank_line = false) {
    return std::string("WARNING:") + crlf + selected + but + crlf + (blank_line ? crlf : "") + advice;
}

}  // namespace

void check_trigger_setup() {
    using namespace global;
    std::string message;
    auto add = [&message](const std::string& text) {
        if (!message.empty())
            message += std::string(crlf) + crlf + crlf;
        message += text;
    };

    const bool inputs = trigger_source == 1 || trigger_source == 2 || trigger_source == 3;
    if (!inputs)
        return;
    if (trigger_source == 3) {
        if (!any_set_to_trigger(source_ids, num_sources))
            add(warning("Source triggering has been selected,", " but no sources have been set to trigger",
                        "You may want to turn on source triggering in the Source page."));
        if (any_set_to_trigger(input_ids, num_inputs))
            add(warning("Source triggering has been selected,", " but some inputs have been set to trigger.",
                        std::string("You may want to turn off channel triggering") + " in the Input page."));
    } else if (trigger_source == 2) {
        if (!any_set_to_trigger(input_ids, num_inputs))
            add(warning("Input triggering has been selected,", " but no inputs have been set to trigger",
                        "You may want to turn on channel triggering in the Input page."));
        if (any_set_to_trigger(source_ids, num_sources))
            add(warning("Input triggering has been selected,", " but some sources have been set to trigger.",
                        std::string("You may want to turn off channel triggering") + " in the Source page."));
    } else {
        if (any_set_to_trigger(input_ids, num_inputs))
            add(warning("Manual triggering has been selected,",
                        " but some input channels have been set to trigger",
                        "You may want to turn off channel triggering in the Input page.", true));
        if (any_set_to_trigger(source_ids, num_sources))
            add(warning("Manual triggering has been selected,", " but some sources have been set to trigger.",
                        std::string("You may want to turn off channel triggering") + " in the Source page."));
    }
    if (!message.empty())
        dialogs::notice(message);
}
