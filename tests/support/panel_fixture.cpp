#include "panel_fixture.h"

#include "core/global.h"
#include "core/windows.h"

void PanelTest::SetUp() {
    forms::destroy_all();
    use_system(sim::default_system());
    dialogs::set_responder([this](dialogs::Kind kind, const std::string& text) {
        messages.push_back({kind, text});
        if (kind == dialogs::Kind::notice)
            return dialogs::Answer::ok;
        if (answers_.empty())
            return dialogs::Answer::yes;
        dialogs::Answer a = answers_.front();
        answers_.pop_front();
        return a;
    });
}

void PanelTest::TearDown() {
    forms::destroy_all();
    dialogs::clear_responder();
}

void PanelTest::use_system(const std::vector<sim::ModuleSpec>& modules) {
    sim::reset(modules);
    global::set_defaults();
    global::interface_name.clear();
    global::module_count = 0;
    global::module_address.clear();
    global::module_inputs.clear();
    global::module_sources.clear();
    global::module_tachs.clear();
    global::module_memory.clear();
    global::module_use.clear();
    global::num_inputs = global::num_sources = global::num_tachs = 0;
    global::input_ids.assign(1, 0);
    global::source_ids.assign(1, 0);
    global::tach_ids.assign(1, 0);
    global::all_ids.assign(1, 0);
    global::driver_revision.clear();
}
