// Start-up: discovery, the session over the modules in use, and the fatal start-up messages.
#include <gtest/gtest.h>

#include <QFontMetrics>
#include <functional>

#include "core/GreetFrm.h"
#include "core/global.h"
#include "core/startup.h"
#include "core/windows.h"
#include "display/MainFrm.h"
#include "ost7720.h"
#include "pages/resource_list.h"
#include "panel_fixture.h"

namespace {

using Names = std::vector<std::string>;
using Ids = std::vector<int32_t>;

// from..to, then the closing 0 every id list carries.
Ids ids(int32_t from, int32_t to, Ids tail = {0}) {
    Ids out;
    for (int32_t i = from; i <= to; ++i)
        out.push_back(i);
    out.insert(out.end(), tail.begin(), tail.end());
    return out;
}

class StartupTest : public PanelTest {};

TEST_F(StartupTest, DefaultSystemCallSequenceChannelListsAndFirstTrace) {
    MainFrm& main = forms::get<MainFrm>();
    main.Form_Load();

    // Each module probed (three init stages, channel count, memory, close), then the session.
    const Names probe = {"ost7720_initA",       "ost7720_initB3",      "ost7720_initC",
                         "ost7720_getNumChans", "ost7720_getHWConfig", "ost7720_close"};
    Names expected = {"ost7720_find"};
    for (int module = 0; module < 2; ++module)
        expected.insert(expected.end(), probe.begin(), probe.end());
    expected.insert(expected.end(), {"ost7720_init", "ost7720_getNumChans", "ost7720_revision_query",
                                     "ost7720_deleteAllChanGroups"});
    expected.insert(expected.end(), 4, "ost7720_createChannelGroup");
    EXPECT_EQ(sim::call_names(), expected);

    const auto& log = sim::call_log();
    EXPECT_EQ(log[1].args.at(0), "\"VXI0::8::INSTR\"");  // probed in address order
    EXPECT_EQ(log[7].args.at(0), "\"VXI0::16::INSTR\"");
    EXPECT_EQ(log[5].args.at(0), "0");                       // memory query before any session exists
    EXPECT_EQ(log[13].args.at(0), "\"VXI0::16,8::INSTR\"");  // last found first

    using namespace global;
    EXPECT_EQ(module_address, (Ids{8, 16, 0}));
    EXPECT_EQ(module_memory, (Names{" 8 MByte", " 32 MByte", ""}));
    EXPECT_EQ(module_tachs[0], 2);
    EXPECT_NE(session, 0);
    EXPECT_EQ(input_ids, ids(1, 16));
    EXPECT_EQ(all_ids, ids(1, 16, {4097, 4098, 8193, 8194, 0}));  // inputs, sources, tachometers
    EXPECT_NE(group_all, group_inputs);
    EXPECT_FALSE(driver_revision.empty());
    EXPECT_NE(driver_revision.back(), ' ');
    EXPECT_EQ(trace_channel[0], 1);
    EXPECT_EQ(trace_channel[1], 0);
    EXPECT_TRUE(messages.empty());
    EXPECT_TRUE(main.isVisible());
}

TEST_F(StartupTest, SplashStandsInTheMainWindowsPlaceAndAFailedProbeGoesOn) {
    MainFrm& main = forms::get<MainFrm>();
    // A failing channel count raises the report while the splash is up: look at the windows then.
    // A failing memory query reads "unknown" for its module only, and asks nothing.
    sim::fail("ost7720_getNumChans", -1074003951, 1);
    sim::fail("ost7720_getHWConfig", -1074003951, 1);
    int questions = 0;
    dialogs::set_responder([&](dialogs::Kind, const std::string& text) {
        GreetFrm& splash = forms::get<GreetFrm>();
        EXPECT_TRUE(splash.isVisible() && !main.isVisible());
        EXPECT_EQ(splash.frameGeometry(), main.frameGeometry());
        const QLineEdit* box = splash.Text1;
        EXPECT_EQ(box->text().toStdString(), "Initializing K7720A VXI Modules");
        EXPECT_GE(box->width(), QFontMetrics(box->font()).horizontalAdvance(box->text()));  // whole text
        EXPECT_NEAR(box->x() + box->width() / 2.0, splash.width() / 2.0, 5.0);
        EXPECT_NE(text.find("ost7720_getNumChans returned -1074003951"), std::string::npos);
        ++questions;
        return dialogs::Answer::yes;
    });
    main.Form_Load();
    EXPECT_EQ(questions, 1);
    EXPECT_TRUE(main.isVisible());
    EXPECT_EQ(main.frameGeometry(), forms::get<GreetFrm>().frameGeometry());
    EXPECT_FALSE(forms::get<GreetFrm>().isVisible());
    // Yes went on: the first module's counts stay 0, the second was probed normally.
    EXPECT_EQ(global::module_inputs, (Ids{0, 8, 0}));
    EXPECT_EQ(global::module_memory, (Names{"unknown", " 32 MByte", ""}));
}

TEST_F(StartupTest, ResourceListFollowsModuleUse) {
    global::interface_name = "VXI0";
    global::module_count = 3;
    global::module_address = {8, 16, 24, 0};
    global::module_use = {global::flag_true, global::flag_true, global::flag_true, 0};
    EXPECT_EQ(getRscsString(), "VXI0::24,16,8::INSTR");
    global::module_use[1] = global::flag_false;
    EXPECT_EQ(getRscsString(), "VXI0::24,8::INSTR");
    global::module_use[2] = 1;  // only -1 counts as true
    EXPECT_EQ(getRscsString(), "VXI0::8::INSTR");
    global::module_use[0] = global::flag_false;
    EXPECT_EQ(getRscsString(), "");
}

TEST_F(StartupTest, NoModuleInUseOpensNoSessionButStillAsksTheDriver) {
    forms::get<MainFrm>().Form_Load();
    const int32_t old_session = global::session;
    global::module_use.assign(global::module_use.size(), global::flag_false);
    sim::clear_call_log();
    open_session();
    EXPECT_EQ(global::session, 0);
    EXPECT_EQ(global::input_ids, Ids{0});
    Names expected = {"ost7720_close", "ost7720_revision_query", "ost7720_deleteAllChanGroups"};
    expected.insert(expected.end(), 4, "ost7720_createChannelGroup");
    // Whatever the driver answered with handle 0 was reported, each under its own name, and
    // the sequence went on.
    Names steps;
    size_t failures = 0;
    for (const sim::Call& call : sim::call_log()) {
        if (call.name == "ost7720_error_message" || call.name == "ost7720_errorDetails")
            continue;
        steps.push_back(call.name);
        EXPECT_EQ(call.args.at(0), steps.size() == 1 ? std::to_string(old_session) : "0") << call.line();
        if (call.status == 0)
            continue;
        ASSERT_LT(failures, messages.size());
        EXPECT_NE(messages[failures++].text.find(call.name + " returned " + std::to_string(call.status)),
                  std::string::npos);
    }
    EXPECT_EQ(steps, expected);
    EXPECT_EQ(failures, messages.size());
}

// The fatal messages end the process, so they run in a death test's child: the responder
// prints whether the text was exactly the expected one, and the exit status must be 0.
TEST_F(StartupTest, NoModulesFailingFindOrFailingInitShowsItsMessageAndEnds) {
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    const std::string advice =
        "\r\n\r\nRecheck your configuration and run the resource manager.\r\n"
        "Run this soft front panel again after correcting the problem.\r\n";
    const std::string no_modules = "No Ostrana K7720A modules can be found in this system." + advice;
    std::string driver_text(250, ' ');
    ost7720_error_message(0, -1074003951, driver_text.data());
    const std::string init_error =
        "ost7720_init returned error: " + driver_text.substr(0, driver_text.find('\0')) + advice;
    const std::vector<std::tuple<const char*, std::function<void()>, std::string>> cases = {
        {"no module", [] { sim::reset({}); }, no_modules},
        {"find fails", [] { sim::fail("ost7720_find", -1074003951); }, no_modules},
        {"initA fails", [] { sim::fail("ost7720_initA", -1074003951, 1); }, init_error},
        {"initB3 fails", [] { sim::fail("ost7720_initB3", -1074003951, 1); }, init_error},
        {"initC fails", [] { sim::fail("ost7720_initC", -1074003951, 1); }, init_error},
    };
    for (const auto& [name, arrange, expected] : cases) {
        EXPECT_EXIT(
            {
                arrange();
                dialogs::set_responder([&](dialogs::Kind kind, const std::string& text) {
                    const bool exact = text == expected && kind == dialogs::Kind::notice;
                    fprintf(stderr, "%s", exact ? "EXACT-MESSAGE" : text.c_str());
                    return dialogs::Answer::ok;
                });
                forms::get<MainFrm>().Form_Load();
                fprintf(stderr, "PROGRAM-WENT-ON");
            },
            testing::ExitedWithCode(0), "^EXACT-MESSAGE$")
            << name;
    }
}

}  // namespace
