#include "pages/resource_list.h"

#include "core/global.h"
#include "core/number_text.h"

std::string getRscsString() {
    using namespace global;
    std::string text = interface_name + "::";
    bool any = false;
    for (int32_t k = module_count - 1; k >= 0; --k) {
        if (static_cast<size_t>(k) < module_use.size() && module_use[k] == flag_true) {
            text += numtext::text(module_address[k]) + ",";
            any = true;
        }
    }
    if (!any)
        return {};
    text.pop_back();
    return text + "::INSTR";
}
