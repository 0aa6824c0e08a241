// The fault sweep: a scripted user session on the simulator, run once cleanly to learn which
// driver functions each of its steps calls, then once more for every such call site with that
// function failing throughout the step. Every failure must be reported under the function's own
// name and code, Yes must let the session finish, and Go must still give a block afterwards.
// Answering No must end the program at once (a death test per function). Discovery's find and
// init calls end the program with their own messages: tests/core/startup_test.cpp checks those.
#include <cstdio>
#include <functional>
#include <map>
#include <set>

#include "pages/DispFrm.h"
#include "pages/InputFrm.h"
#include "pages/MeasFrm.h"
#include "pages/SrcFrm.h"
#include "pages/VxiFrm.h"
#include "run_fixture.h"

namespace {

constexpr int32_t failure = -1074003951;
// Longer than one 1024-point block at the top span (0.02 s), so every tick may find one.
constexpr double tick_seconds = 0.05;

const std::set<std::string> fatal_at_start = {"ost7720_find", "ost7720_initA", "ost7720_initB3",
                                              "ost7720_initC"};
// Without these the session has no channels or no groups until it is opened again.
const std::set<std::string> session_builders = {"ost7720_init", "ost7720_getNumChans",
                                                "ost7720_createChannelGroup"};

struct Step {
    std::string name;
    std::function<void()> run;
};

// What one step of a session called: each function and how often.
using StepCalls = std::map<std::string, size_t>;

class FaultSweepTest : public RunTest {
  protected:
    void SetUp() override {
        RunTest::SetUp();
        GTEST_FLAG_SET(death_test_style, "threadsafe");
    }
    std::string trace_file(int t) const { return file("trace" + std::to_string(t + 1) + ".txt"); }

    // A fresh program run: no window, the simulator powered on, the clock stopped.
    void power_on() {
        forms::destroy_all();
        use_system(sim::default_system());
        sim::use_virtual_clock();
        messages.clear();
        empty_folder();
    }
    // Ticks until the run ends or a few ticks gave no block (a failing poll never gives one).
    static void tick_until_idle() {
        for (int n = 0; n < 6 && global::running == global::flag_true; ++n)
            tick(tick_seconds);
    }
    static void go_until_idle() {
        click(main().GoBtn);
        tick_until_idle();
    }
    static void meas_page(const std::function<void(MeasFrm&)>& choose) {
        click(main().MeasBtn);
        choose(forms::get<MeasFrm>());
        click(forms::get<MeasFrm>().doneBtn);
    }

    // The session, step by step, through the main window's buttons and the pages' controls.
    std::vector<Step> session() {
        return {
            {"start-up", [] { main().Form_Load(); }},
            {"Display page: four traces with files, OK",
             [this] {
                 click(main().DispBtn);
                 DispFrm& page = forms::get<DispFrm>();
                 for (int t = 0; t < 4; ++t) {
                     page.TrcChanCmbo[t]->setEditText(QString::number(t + 1));
                     page.Text1[t]->setText(QString::fromStdString(trace_file(t)));
                 }
                 click(page.doneBtn);
             }},
            {"Go in Single Block", go_until_idle},
            {"Meas page: Repeat, Frequency, OK",
             [] { meas_page([](MeasFrm& p) { click(p.RepeatBtn), click(p.FreqBtn); }); }},
            {"Go in Repeat, three blocks, Stop",
             [] {
                 click(main().GoBtn);
                 for (int n = 0; n < 3; ++n)
                     tick(tick_seconds);
                 if (global::running == global::flag_true)
                     click(main().GoBtn);
             }},
            {"Meas page: Manual, Single Block, Time, OK",
             [] { meas_page([](MeasFrm& p) { click(p.ManualBtn), click(p.SingleBtn), click(p.TimeBtn); }); }},
            {"Go in Manual with the Trigger button",
             [] {
                 click(main().GoBtn);
                 tick(tick_seconds);  // the first tick makes Trigger usable
                 click(main().TriggerBtn);
                 tick_until_idle();
             }},
            {"Meas page: Auto, Multi Mainframe, OK",
             [] { meas_page([](MeasFrm& p) { click(p.AutoBtn), p.mmcheck->setChecked(true); }); }},
            {"Go across mainframes", go_until_idle},
            {"Meas page: one mainframe, OK",
             [] { meas_page([](MeasFrm& p) { p.mmcheck->setChecked(false); }); }},
            {"Input page OK", [] { click(main().InpBtn), click(forms::get<InputFrm>().doneBtn); }},
            {"Source page: Default Values, Apply",
             [] {
                 click(main().SrcBtn), click(forms::get<SrcFrm>().PresetBtn),
                     click(forms::get<SrcFrm>().ApplyBtn);
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
             [] { click(main().VxiBtn), click(forms::get<VxiFrm>().doneBtn); }},
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
            StepCalls& seen = calls.emplace_back();
            for (size_t i = first; i < sim::call_log().size(); ++i)
                ++seen[sim::call_log()[i].name];
        }
        return calls;
    }

    // With every failure gone, Go still gives a block in all four traces and their files.
    void expect_go_works() {
        ASSERT_TRUE(main().isVisible());
        const size_t before = messages.size();
        global::trace_has_data.fill(global::flag_false);
        go_until_idle();
        EXPECT_EQ(main().GoBtn->text(), "Go");
        EXPECT_EQ(global::running, global::flag_false);
        for (int t = 0; t < 4; ++t) {
            EXPECT_EQ(global::trace_has_data[t], global::flag_true) << "trace " << t + 1;
            EXPECT_EQ(lines_in(trace_file(t)), static_cast<size_t>(global::num_points) + 1)
                << "trace " << t + 1;
        }
        EXPECT_EQ(messages.size(), before);
    }

    // "name returned code" of every question asked, in order.
    std::vector<std::string> reports() const {
        std::vector<std::string> out;
        const std::string lead = "ost7720_32.dll: ";
        for (const Message& m : messages) {
            const size_t from = m.text.find(lead);
            if (m.kind == dialogs::Kind::notice)
                continue;
            if (from == std::string::npos)
                out.push_back("unexpected question: " + m.text);
            else
                out.push_back(m.text.substr(
                    from + lead.size(),
                    m.text.find(' ', m.text.find(" returned ", from) + 10) - from - lead.size()));
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
            const bool handled =
                c.name == "ost7720_error_message" ||
                c.name == "ost7720_errorDetails"                         // the report's own calls
                || (c.name == "ost7720_blockAvailable" && c.status > 0)  // not an error
                || c.name == "ost7720_setSpan"                           // the span message instead
                || (i < discovery_end_ && (c.name == "ost7720_close" || c.name == "ost7720_getHWConfig"));
            if (c.status != 0 && !handled)
                out.push_back(c.name + " returned " + std::to_string(c.status));
        }
        return out;
    }

    size_t notices_starting(const std::string& text) const {
        return static_cast<size_t>(std::count_if(messages.begin(), messages.end(), [&](const Message& m) {
            return m.kind == dialogs::Kind::notice && m.text.starts_with(text);
        }));
    }

    size_t discovery_end_ = 0;  // log entries made by start-up
};

TEST_F(FaultSweepTest, EveryCallSiteFailingIsReportedUnderItsNameYesFinishesAndGoStillWorks) {
    const std::vector<StepCalls> clean = run_session();
    EXPECT_EQ(reports(), std::vector<std::string>{});
    expect_go_works();
    const std::vector<Step> steps = session();
    ASSERT_EQ(clean.size(), steps.size());

    std::set<std::string> functions;
    size_t sites = 0;
    for (size_t s = 0; s < steps.size(); ++s) {
        for (const auto& [function, clean_count] : clean[s]) {
            functions.insert(function);
            if (s == 0 && fatal_at_start.count(function))
                continue;  // ends the program
            ++sites;
            SCOPED_TRACE(steps[s].name + ": " + function);
            const std::vector<StepCalls> run = run_session(steps[s].name, function);
            const size_t failed = run[s].count(function) ? run[s].at(function) : 0;
            EXPECT_GE(failed, 1u);
            // Each failed call is reported once, in call order, under its own name and the
            // driver's code; later calls the driver refuses because of it are reported too.
            EXPECT_EQ(reports(), expected_reports());
            if (function == "ost7720_setSpan") {
                EXPECT_EQ(notices_starting("The selected span is too high"), failed);
            }
            if (function == "ost7720_checkSrcArbRdy") {
                EXPECT_EQ(notices_starting("The arbritray source is refusing to take data"), failed);
            }
            if (s == 0 && function == "ost7720_getHWConfig") {
                EXPECT_EQ(global::module_memory[0], "unknown");
            }
            // Yes let the session finish: the main window is back and Go gives a block. A
            // failure that left no usable session when the VXI page opened it last needs that
            // page's OK once more, as a user would do.
            if (s + 1 == steps.size() && session_builders.count(function)) {
                go_until_idle();  // refused call by call, but it must not hang or crash
                if (global::running == global::flag_true)
                    click(main().GoBtn);
                click(main().VxiBtn);
                click(forms::get<VxiFrm>().doneBtn);
            }
            expect_go_works();
        }
    }
    // Every function the session calls was made to fail somewhere.
    std::printf(
        "[ fault sweep ] %zu driver functions, %zu call sites (function within a session step)"
        " answered Yes, %zu fatal at start-up\n",
        functions.size(), sites, fatal_at_start.size());
    EXPECT_GE(functions.size(), 40u);
    EXPECT_GE(sites, functions.size());
    for (const std::string& f : fatal_at_start) {
        EXPECT_TRUE(functions.count(f)) << f;
    }
}

// The first report's No ends the program: nothing after it runs, neither another message nor
// the rest of the session. A function whose failure is never reported (the memory query) or
// shows its own notice (the span) lets the session run on to Exit, which ends the program.
TEST_F(FaultSweepTest, AnsweringNoToAnyReportEndsTheProgramAtOnce) {
    std::set<std::string> functions;
    for (const StepCalls& step : run_session())
        for (const auto& [name, count] : step)
            if (!fatal_at_start.count(name))
                functions.insert(name);
    for (const std::string& function : functions) {
        const bool never_asked = function == "ost7720_getHWConfig" || function == "ost7720_setSpan";
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
            testing::ExitedWithCode(0), never_asked ? "^EXIT$" : "^NO " + function + "$")
            << function;
    }
    std::printf("[ fault sweep ] No ends the program: %zu driver functions\n", functions.size());
}

}  // namespace
