// The fault sweep: a scripted user session on the simulator, run once cleanly to learn which
// driver functions each of its steps calls, then once more for every such call site with that
// function failing throughout the step. Every failure must be reported under the function's own
// name and code, Yes must let the session finish, and Go must still give a block afterwards.
// Answering No must end the program at once (death tests, one per function), and a failure in
// discovery's find or init calls must show its fatal message and end the program.
#include <gtest/gtest.h>

#include <unistd.h>

#include <QTest>
#include <cstdio>
#include <filesystem>
#include <fstream>
#include <functional>
#include <map>
#include <set>
#include <string>
#include <vector>

#include "core/global.h"
#include "core/windows.h"
#include "display/MainFrm.h"
#include "pages/DispFrm.h"
#include "pages/InputFrm.h"
#include "pages/MeasFrm.h"
#include "pages/SrcFrm.h"
#include "pages/VxiFrm.h"
#include "panel_fixture.h"

namespace {

namespace fs = std::filesystem;

constexpr int32_t failure = -1074003951;
// Longer than one 1024-point block at the top span (0.02 s), so every tick may find one.
constexpr double tick_seconds = 0.05;
// Ticks a step waits for a block before it moves on (a failing poll never gives one).
constexpr int max_ticks = 6;

const std::string span_message = "The selected span is too high";
const std::string arb_refused = "The arbritray source is refusing to take data";

// Discovery's own handling: these end the program with a fatal message.
const std::set<std::string> fatal_at_start = {"ost7720_find", "ost7720_initA", "ost7720_initB3",
                                              "ost7720_initC"};

// Without these the session has no channels or no groups until it is opened again.
const std::set<std::string> session_builders = {"ost7720_init", "ost7720_getNumChans",
                                                "ost7720_createChannelGroup"};

struct Step {
    std::string name;
    std::function<void()> run;
};

// What one step of the clean session called: each function and how often.
using StepCalls = std::map<std::string, size_t>;

class FaultSweepTest : public PanelTest {
  protected:
    void SetUp() override {
        PanelTest::SetUp();
        dir_ = fs::temp_directory_path() / ("k7720-sweep-" + std::to_string(::getpid()));
        GTEST_FLAG_SET(death_test_style, "threadsafe");
    }
    void TearDown() override {
        fs::remove_all(dir_);
        PanelTest::TearDown();
    }

    MainFrm& main() { return forms::get<MainFrm>(); }
    static void click(QAbstractButton* b) { QTest::mouseClick(b, Qt::LeftButton); }
    std::string file(int t) const { return (dir_ / ("trace" + std::to_string(t + 1) + ".txt")).string(); }

    // A fresh program run: no window, the simulator powered on, the clock stopped.
    void power_on() {
        forms::destroy_all();
        use_system(sim::default_system());
        sim::use_virtual_clock();
        messages.clear();
        fs::remove_all(dir_);
        fs::create_directories(dir_);
    }

    void tick() {
        sim::advance_clock(tick_seconds);
        main().MainTimer_Timer();
    }
    // Ticks until the run ends or the step gives up waiting.
    void tick_until_idle() {
        for (int n = 0; n < max_ticks && global::running == global::flag_true; ++n)
            tick();
    }

    // The session, step by step, through the main window's buttons and the pages' controls.
    std::vector<Step> session() {
        return {
            {"start-up", [this] { main().Form_Load(); }},
            {"Display page: four traces with files, OK",
             [this] {
                 click(main().DispBtn);
                 DispFrm& page = forms::get<DispFrm>();
                 for (int t = 0; t < 4; ++t) {
                     page.TrcChanCmbo[t]->setEditText(QString::number(t + 1));
                     page.Text1[t]->setText(QString::fromStdString(file(t)));
                 }
                 click(page.doneBtn);
             }},
            {"Go in Single Block",
             [this] {
                 click(main().GoBtn);
                 tick_until_idle();
             }},
            {"Meas page: Repeat, Frequency, OK",
             [this] {
                 click(main().MeasBtn);
                 MeasFrm& page = forms::get<MeasFrm>();
                 click(page.RepeatBtn);
                 click(page.FreqBtn);
                 click(page.doneBtn);
             }},
            {"Go in Repeat, three blocks, Stop",
             [this] {
                 click(main().GoBtn);
                 for (int n = 0; n < 3; ++n)
                     tick();
                 if (global::running == global::flag_true)
                     click(main().GoBtn);
             }},
            {"Meas page: Manual, Single Block, Time, OK",
             [this] {
                 click(main().MeasBtn);
                 MeasFrm& page = forms::get<MeasFrm>();
                 click(page.ManualBtn);
                 click(page.SingleBtn);
                 click(page.TimeBtn);
                 click(page.doneBtn);
             }},
            {"Go in Manual with the Trigger button",
             [this] {
                 click(main().GoBtn);
                 tick();  // the first tick makes Trigger usable
                 click(main().TriggerBtn);
                 tick_until_idle();
             }},
            {"Meas page: Auto, Multi Mainframe, OK",
             [this] {
                 click(main().MeasBtn);
                 MeasFrm& page = forms::get<MeasFrm>();
                 click(page.AutoBtn);
                 page.mmcheck->setChecked(true);
                 click(page.doneBtn);
             }},
            {"Go across mainframes",
             [this] {
                 click(main().GoBtn);
                 tick_until_idle();
             }},
            {"Meas page: one mainframe, OK",
             [this] {
                 click(main().MeasBtn);
                 MeasFrm& page = forms::get<MeasFrm>();
                 page.mmcheck->setChecked(false);
                 click(page.doneBtn);
             }},
            {"Input page OK",
             [this] {
                 click(main().InpBtn);
                 click(forms::get<InputFrm>().doneBtn);
             }},
            {"Source page: Default Values, Apply",
             [this] {
                 click(main().SrcBtn);
                 SrcFrm& page = forms::get<SrcFrm>();
                 click(page.PresetBtn);
                 click(page.ApplyBtn);
             }},
            {"Source page: active Arbitrary, Apply, OK",
             [] {
                 SrcFrm& page = forms::get<SrcFrm>();
                 page.ActiveCmbo->setEditText("On");
                 page.ModeCmbo->setEditText("Arbitrary");
                 click(page.ApplyBtn);
                 click(page.doneBtn);
             }},
            {"VXI page OK: the session opened again",
             [this] {
                 click(main().VxiBtn);
                 click(forms::get<VxiFrm>().doneBtn);
             }},
        };
    }

    // Runs the session; failing names a step whose calls of the function all fail.
    std::vector<StepCalls> run_session(const std::string& failing_step = "",
                                       const std::string& function = "") {
        power_on();
        std::vector<StepCalls> calls;
        for (const Step& step : session()) {
            if (step.name == failing_step)
                sim::fail(function, failure);
            const size_t first = sim::call_log().size();
            step.run();
            sim::clear_failures();
            if (calls.empty())
                discovery_end_ = sim::call_log().size();
            StepCalls seen;
            const auto& log = sim::call_log();
            for (size_t i = first; i < log.size(); ++i)
                ++seen[log[i].name];
            calls.push_back(std::move(seen));
        }
        return calls;
    }

    // With every failure gone, Go still gives a block in all four traces and their files.
    void expect_go_works(const std::string& context) {
        SCOPED_TRACE(context);
        ASSERT_TRUE(main().isVisible());
        sim::clear_failures();
        const size_t before = messages.size();
        global::trace_has_data.fill(global::flag_false);
        click(main().GoBtn);
        tick_until_idle();
        EXPECT_EQ(main().GoBtn->text(), "Go");
        EXPECT_EQ(global::running, global::flag_false);
        for (int t = 0; t < 4; ++t) {
            EXPECT_EQ(global::trace_has_data[t], global::flag_true) << "trace " << t + 1;
            std::ifstream in(file(t), std::ios::binary);
            const std::string all((std::istreambuf_iterator<char>(in)), std::istreambuf_iterator<char>());
            EXPECT_EQ(std::count(all.begin(), all.end(), '\n'), global::num_points + 1) << "trace " << t + 1;
        }
        EXPECT_EQ(messages.size(), before);
    }

    // "name returned code" of every question asked, in order.
    std::vector<std::string> reports() const {
        std::vector<std::string> out;
        for (const Message& m : messages) {
            if (m.kind != dialogs::Kind::question)
                continue;
            const std::string lead = "ost7720_32.dll: ";
            const size_t from = m.text.find(lead);
            if (from == std::string::npos) {
                out.push_back("unexpected question: " + m.text);
                continue;
            }
            const size_t name_end = m.text.find(' ', from + lead.size());
            const size_t code_end = m.text.find(' ', m.text.find("returned ", name_end) + 9);
            out.push_back(m.text.substr(from + lead.size(), code_end - from - lead.size()));
        }
        return out;
    }

    // What the panel must report for the calls in the log that failed: every failure, in call
    // order, but for the ones it handles itself.
    std::vector<std::string> expected_reports() const {
        std::vector<std::string> out;
        const auto& log = sim::call_log();
        for (size_t i = 0; i < log.size(); ++i) {
            const sim::Call& c = log[i];
            if (c.status == 0)
                continue;
            if (c.name == "ost7720_error_message" || c.name == "ost7720_errorDetails")
                continue;  // the report's own calls; their status is not looked at
            if (c.name == "ost7720_blockAvailable" && c.status > 0)
                continue;  // a positive poll status is no error
            if (c.name == "ost7720_setSpan")
                continue;  // the span message instead
            if (i < discovery_end_ && (c.name == "ost7720_close" || c.name == "ost7720_getHWConfig"))
                continue;  // discovery's probe does not look at these
            out.push_back(c.name + " returned " + std::to_string(c.status));
        }
        return out;
    }

    size_t questions() const {
        size_t n = 0;
        for (const Message& m : messages)
            n += m.kind == dialogs::Kind::question;
        return n;
    }
    size_t notices_starting(const std::string& text) const {
        size_t n = 0;
        for (const Message& m : messages)
            n += m.kind == dialogs::Kind::notice && m.text.rfind(text, 0) == 0;
        return n;
    }

    // The functions the clean session calls, in name order.
    std::set<std::string> called_functions() {
        std::set<std::string> names;
        for (const StepCalls& step : run_session())
            for (const auto& [name, count] : step)
                names.insert(name);
        return names;
    }

    fs::path dir_;
    size_t discovery_end_ = 0;  // log entries made by start-up
};

TEST_F(FaultSweepTest, EveryCallSiteFailingIsReportedUnderItsNameYesFinishesAndGoStillWorks) {
    const std::vector<StepCalls> clean = run_session();
    EXPECT_EQ(questions(), 0u);
    expect_go_works("clean session");
    const std::vector<Step> steps = session();
    ASSERT_EQ(clean.size(), steps.size());

    std::set<std::string> functions;
    size_t sites = 0;
    for (size_t s = 0; s < steps.size(); ++s) {
        for (const auto& [function, clean_count] : clean[s]) {
            functions.insert(function);
            if (s == 0 && fatal_at_start.count(function))
                continue;  // ends the program: the death test below
            ++sites;
            SCOPED_TRACE(steps[s].name + ": " + function);
            const std::vector<StepCalls> run = run_session(steps[s].name, function);
            const size_t failed = run[s].count(function) ? run[s].at(function) : 0;
            EXPECT_GE(failed, 1u);
            // Each failed call is reported once, in call order, under its own name and the
            // driver's code; later calls the driver refuses because of it are reported too.
            EXPECT_EQ(reports(), expected_reports());
            if (function == "ost7720_setSpan") {
                EXPECT_EQ(notices_starting(span_message), failed);
            }
            if (function == "ost7720_checkSrcArbRdy") {
                EXPECT_EQ(notices_starting(arb_refused), failed);
            }
            if (s == 0 && function == "ost7720_getHWConfig") {
                EXPECT_EQ(global::module_memory[0], "unknown");
            }
            // Yes let the session finish: the main window is back and Go gives a block. A
            // failure that left no usable session when the VXI page opened it last needs that
            // page's OK once more, as a user would do.
            if (s + 1 == steps.size() && session_builders.count(function)) {
                sim::clear_failures();
                click(main().GoBtn);  // refused call by call, but it must not hang or crash
                tick_until_idle();
                if (global::running == global::flag_true)
                    click(main().GoBtn);
                click(main().VxiBtn);
                click(forms::get<VxiFrm>().doneBtn);
            }
            expect_go_works(steps[s].name + ": " + function);
        }
    }
    // Every function the session calls was made to fail somewhere.
    std::printf(
        "[ fault sweep ] %zu driver functions, %zu call sites (function within a session step)"
        " answered Yes, %zu fatal at start-up\n",
        functions.size(), sites, fatal_at_start.size());
    EXPECT_GE(functions.size(), 40u);
    EXPECT_GE(sites, functions.size());
    for (const std::string& f : fatal_at_start)
        EXPECT_TRUE(functions.count(f)) << f;
}

// The first report's No ends the program: nothing after it runs, neither another message nor
// the rest of the session. A function whose failure is never reported (the memory query) or
// shows its own notice (the span) lets the session run on to Exit.
TEST_F(FaultSweepTest, AnsweringNoToAnyReportEndsTheProgramAtOnce) {
    const std::set<std::string> functions = called_functions();
    size_t checked = 0;
    for (const std::string& function : functions) {
        if (fatal_at_start.count(function))
            continue;
        const bool never_asked = function == "ost7720_getHWConfig" || function == "ost7720_setSpan";
        const std::string expected = never_asked ? "^EXIT$" : "^NO " + function + "$";
        EXPECT_EXIT(
            {
                dialogs::set_responder([](dialogs::Kind kind, const std::string& text) {
                    if (kind == dialogs::Kind::notice)
                        return dialogs::Answer::ok;
                    const size_t from = text.find("dll: ") + 5;
                    std::fprintf(stderr, "NO %s", text.substr(from, text.find(' ', from) - from).c_str());
                    return dialogs::Answer::no;
                });
                power_on();
                sim::fail(function, failure);
                for (const Step& step : session())
                    step.run();
                std::fprintf(stderr, "EXIT");
                click(main().ExitBtn);
                std::fprintf(stderr, " RETURNED");
            },
            testing::ExitedWithCode(0), expected)
            << function;
        ++checked;
    }
    std::printf("[ fault sweep ] No ends the program: %zu driver functions\n", checked);
}

// Exit after a clean session ends the program after closing the session; a failing close is
// reported and either answer still ends it.
TEST_F(FaultSweepTest, ExitAfterTheSessionEndsTheProgram) {
    for (const char* answer : {"", "yes", "no"}) {
        const bool fail_close = *answer != 0;
        const dialogs::Answer a = std::string(answer) == "no" ? dialogs::Answer::no : dialogs::Answer::yes;
        EXPECT_EXIT(
            {
                run_session();
                dialogs::set_responder([a](dialogs::Kind, const std::string& text) {
                    std::fprintf(stderr, "%s",
                                 text.find("ost7720_close returned") != std::string::npos ? "CLOSE" : "?");
                    return a;
                });
                if (fail_close)
                    sim::fail("ost7720_close", failure);
                sim::clear_call_log();
                click(main().ExitBtn);
                std::fprintf(stderr, " RETURNED");
            },
            testing::ExitedWithCode(0), fail_close ? "^CLOSE$" : "^$")
            << answer;
    }
}

// Discovery's find and init calls: a fatal message, then the end of the program, whatever else.
TEST_F(FaultSweepTest, FailingFindOrInitAtStartUpShowsTheFatalMessageAndEnds) {
    for (const std::string& function : fatal_at_start) {
        const std::string expected = function == "ost7720_find"
                                         ? "^No Ostrana K7720A modules can be found in this system\\.$"
                                         : "^ost7720_init returned error: .+$";
        EXPECT_EXIT(
            {
                dialogs::set_responder([](dialogs::Kind kind, const std::string& text) {
                    std::fprintf(
                        stderr, "%s",
                        kind == dialogs::Kind::notice ? text.substr(0, text.find('\r')).c_str() : "QUESTION");
                    return dialogs::Answer::yes;
                });
                power_on();
                sim::fail(function, failure);
                main().Form_Load();
                std::fprintf(stderr, " RETURNED");
            },
            testing::ExitedWithCode(0), expected)
            << function;
    }
}

}  // namespace
