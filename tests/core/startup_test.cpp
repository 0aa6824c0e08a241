// Start-up: discovery, the session over the modules in use, and the fatal start-up messages.
#include <gtest/gtest.h>

#include <QFontMetrics>

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

Names probe_calls() {
    return {"ost7720_initA",       "ost7720_initB3",      "ost7720_initC",
            "ost7720_getNumChans", "ost7720_getHWConfig", "ost7720_close"};
}

Names session_calls() {
    return {"ost7720_init",
            "ost7720_getNumChans",
            "ost7720_revision_query",
            "ost7720_deleteAllChanGroups",
            "ost7720_createChannelGroup",
            "ost7720_createChannelGroup",
            "ost7720_createChannelGroup",
            "ost7720_createChannelGroup"};
}

class StartupTest : public PanelTest {};

TEST_F(StartupTest, DefaultSystemCallSequenceChannelListsAndFirstTrace) {
    MainFrm& main = forms::get<MainFrm>();
    main.Form_Load();

    Names expected = {"ost7720_find"};
    for (int module = 0; module < 2; ++module) {
        Names p = probe_calls();
        expected.insert(expected.end(), p.begin(), p.end());
    }
    Names s = session_calls();
    expected.insert(expected.end(), s.begin(), s.end());
    EXPECT_EQ(sim::call_names(), expected);

    const auto& log = sim::call_log();
    EXPECT_EQ(log[1].args.at(0), "\"VXI0::8::INSTR\"");  // found in address order
    EXPECT_EQ(log[7].args.at(0), "\"VXI0::16::INSTR\"");
    EXPECT_EQ(log[5].args.at(0), "0");                       // memory query before any session exists
    EXPECT_EQ(log[13].args.at(0), "\"VXI0::16,8::INSTR\"");  // last found first

    using namespace global;
    EXPECT_EQ(interface_name, "VXI0");
    EXPECT_EQ(module_count, 2);
    EXPECT_EQ(module_address[0], 8);
    EXPECT_EQ(module_address[1], 16);
    EXPECT_EQ(module_memory[0], " 8 MByte");
    EXPECT_EQ(module_memory[1], " 32 MByte");
    EXPECT_EQ(module_tachs[0], 2);
    EXPECT_EQ(module_use[1], flag_true);
    EXPECT_NE(session, 0);
    EXPECT_EQ(num_inputs, 16);
    EXPECT_EQ(num_sources, 2);
    EXPECT_EQ(num_tachs, 2);
    ASSERT_EQ(input_ids.size(), 17u);
    EXPECT_EQ(input_ids[0], 1);
    EXPECT_EQ(input_ids[15], 16);
    EXPECT_EQ(all_ids, (std::vector<int32_t>{1,  2,  3,  4,  5,  6,    7,    8,    9,    10, 11,
                                             12, 13, 14, 15, 16, 4097, 4098, 8193, 8194, 0}));
    EXPECT_NE(group_inputs, 0);
    EXPECT_NE(group_all, group_inputs);
    EXPECT_FALSE(driver_revision.empty());
    EXPECT_EQ(driver_revision.back() == ' ', false);
    EXPECT_EQ(trace_channel[0], 1);
    EXPECT_EQ(trace_channel[1], 0);
    EXPECT_TRUE(messages.empty());
    EXPECT_TRUE(main.isVisible());
}

TEST_F(StartupTest, SplashStandsInTheMainWindowsPlaceDuringDiscovery) {
    MainFrm& main = forms::get<MainFrm>();
    // A failing channel count raises the report while the splash is up: look at the windows then.
    sim::fail("ost7720_getNumChans", -1074003951, 1);
    bool splash_seen = false;
    dialogs::set_responder([&](dialogs::Kind, const std::string&) {
        GreetFrm& splash = forms::get<GreetFrm>();
        splash_seen =
            splash.isVisible() && !main.isVisible() && splash.frameGeometry() == main.frameGeometry();
        EXPECT_EQ(splash.Text1->text().toStdString(), "Initializing K7720A VXI Modules");
        return dialogs::Answer::yes;
    });
    main.Form_Load();
    EXPECT_TRUE(splash_seen);
    EXPECT_TRUE(main.isVisible());
    EXPECT_EQ(main.frameGeometry(), forms::get<GreetFrm>().frameGeometry());
    EXPECT_FALSE(forms::get<GreetFrm>().isVisible());
    // Yes went on: the first module's counts stay 0, the second was probed normally.
    EXPECT_EQ(global::module_inputs[0], 0);
    EXPECT_EQ(global::module_inputs[1], 8);
}

TEST_F(StartupTest, FailedMemoryQueryReadsUnknownForThatModuleOnly) {
    sim::fail("ost7720_getHWConfig", -1074003951, 1);
    forms::get<MainFrm>().Form_Load();
    EXPECT_EQ(global::module_memory[0], "unknown");
    EXPECT_EQ(global::module_memory[1], " 32 MByte");
    EXPECT_TRUE(messages.empty());
}

TEST_F(StartupTest, TwoModulesOfDifferentSizesNumberInputsInResourceListOrder) {
    use_system({{8, 8, 1, 2, 8}, {16, 16, 0, 0, 32}});
    forms::get<MainFrm>().Form_Load();
    using namespace global;
    EXPECT_EQ(num_inputs, 24);
    EXPECT_EQ(input_ids[23], 24);
    EXPECT_EQ(all_ids.size(), 24u + 1 + 2 + 1);
    EXPECT_EQ(all_ids[24], 4097);
    EXPECT_EQ(all_ids[25], 8193);
}

TEST_F(StartupTest, OneModuleGivesTwoElementTables) {
    use_system({{5, 4, 0, 0, 8}});
    forms::get<MainFrm>().Form_Load();
    EXPECT_EQ(global::module_count, 1);
    EXPECT_EQ(global::module_address.size(), 2u);
    EXPECT_EQ(getRscsString(), "VXI0::5::INSTR");
    EXPECT_EQ(global::num_sources, 0);
    EXPECT_EQ(global::source_ids.size(), 1u);
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
    for (auto& use : global::module_use)
        use = global::flag_false;
    sim::clear_call_log();
    open_session();
    EXPECT_EQ(global::session, 0);
    EXPECT_EQ(global::num_inputs, 0);
    EXPECT_EQ(global::input_ids.size(), 1u);
    Names expected = {"ost7720_close",
                      "ost7720_revision_query",
                      "ost7720_deleteAllChanGroups",
                      "ost7720_createChannelGroup",
                      "ost7720_createChannelGroup",
                      "ost7720_createChannelGroup",
                      "ost7720_createChannelGroup"};
    // Whatever the driver answered with handle 0 was reported, each under its own name, and
    // the sequence went on.
    Names steps;
    size_t failures = 0;
    for (const sim::Call& call : sim::call_log()) {
        if (call.name == "ost7720_error_message" || call.name == "ost7720_errorDetails")
            continue;
        steps.push_back(call.name);
        if (call.status == 0)
            continue;
        ASSERT_LT(failures, messages.size());
        EXPECT_NE(messages[failures++].text.find(call.name + " returned " + std::to_string(call.status)),
                  std::string::npos);
    }
    EXPECT_EQ(steps, expected);
    EXPECT_EQ(failures, messages.size());
    EXPECT_EQ(sim::call_log()[0].args.at(0), std::to_string(old_session));
    for (size_t i = 1; i < sim::call_log().size(); ++i)
        EXPECT_EQ(sim::call_log()[i].args.at(0), "0");
}

// The fatal messages end the process, so they run in a death test's child: the responder
// prints whether the text was exactly the expected one, and the exit status must be 0.
void load_expecting_message(const std::string& expected) {
    dialogs::set_responder([expected](dialogs::Kind kind, const std::string& text) {
        fprintf(stderr, "%s",
                text == expected && kind == dialogs::Kind::notice ? "EXACT-MESSAGE" : text.c_str());
        return dialogs::Answer::ok;
    });
    forms::get<MainFrm>().Form_Load();
    fprintf(stderr, "PROGRAM-WENT-ON");
}

const char* const rerun_advice =
    "\r\n\r\nRecheck your configuration and run the resource manager.\r\n"
    "Run this soft front panel again after correcting the problem.\r\n";

TEST_F(StartupTest, NoModulesOrFailingFindEndsTheProgramAfterItsMessage) {
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    const std::string text =
        std::string("No Ostrana K7720A modules can be found in this system.") + rerun_advice;
    EXPECT_EXIT(
        {
            sim::reset({});
            load_expecting_message(text);
        },
        testing::ExitedWithCode(0), "^EXACT-MESSAGE$");
    EXPECT_EXIT(
        {
            sim::fail("ost7720_find", -1074003951);
            load_expecting_message(text);
        },
        testing::ExitedWithCode(0), "^EXACT-MESSAGE$");
}

TEST_F(StartupTest, FailingInitStageShowsTheDriversTextAndEnds) {
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    std::string driver_text(250, ' ');
    ost7720_error_message(0, -1074003951, driver_text.data());
    driver_text.resize(driver_text.find('\0'));
    const std::string text = "ost7720_init returned error: " + driver_text + rerun_advice;
    for (const char* stage : {"ost7720_initA", "ost7720_initB3", "ost7720_initC"}) {
        EXPECT_EXIT(
            {
                sim::fail(stage, -1074003951, 1);
                load_expecting_message(text);
            },
            testing::ExitedWithCode(0), "^EXACT-MESSAGE$")
            << stage;
    }
}

}  // namespace

namespace {

TEST_F(StartupTest, SplashTextFitsItsBoxAndIsCentred) {
    GreetFrm& splash = forms::get<GreetFrm>();
    splash.resize(853, 683);
    splash.show();
    splash.run_resize();
    const QLineEdit* box = splash.Text1;
    EXPECT_GE(box->width(), QFontMetrics(box->font()).horizontalAdvance(box->text()));
    EXPECT_NEAR(box->x() + box->width() / 2.0, splash.width() / 2.0, 5.0);
    EXPECT_NEAR(box->y(), splash.height() / 2.0, 1.0);
}

}  // namespace
