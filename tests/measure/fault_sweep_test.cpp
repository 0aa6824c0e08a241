// The fault sweep: a scripted user session on the simulator, run once cleanly to learn which
// driver functions each of its steps calls, then once more for every such call site with that
// function failing throughout the step. Every failure must be reported under the function's own
// name and code, Yes must let the session finish, and Go must still give a block afterwards.
// Answering No must end the program at once (a death test per function). Discovery's find and
// init calls end the program with their own messages: tests/core/startup_test.cpp checks those.
#include <cstdio>
#include <functional>
#include <regex>
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

class FaultSweepTest : public RunTest {
  protected:
    void SetUp() override {
        RunTest::SetUp();
        GTEST_FLAG_SET(death_test_style, "threadsafe");
    }
    std::string trace_file(int t) const { return file("trace" + std::to_string(t + 1) + ".txt"); }

    // Ticks until the run ends or a few ticks gave no block (a failing poll never gives one).
    static void tick_until_idle() {
        for (int n = 0; n < 6 && global::running == global::flag_true; ++n)
            tick(tick_seconds);
    }
    static void go_until_idle() {
        click(main().GoBtn);
        tick_until_idle();
    }
    static void click_all(std::initializer_list<QAbstractButton*> buttons) {
        for (QAbstractButton* button : buttons)
            click(button);
    }

    // The session through the main window's buttons and the pages' controls, from a fresh
    // program run (no window, the simulator powered on, the clock stopped).
    void session() {
        forms::destroy_all();
        use_system(sim::default_system());
        sim::use_virtual_clock();
        messages.clear();
        empty_folder();
        step("start-up");
        main().Form_Load();
        step("Display page: four traces with files, OK");
        click(main().DispBtn);
        DispFrm& display = forms::get<DispFrm>();
        for (int t = 0; t < 4; ++t) {
            display.TrcChanCmbo[t]->setEditText(QString::number(t + 1));
            display.Text1[t]->setText(QString::fromStdString(trace_file(t)));
        }
        click(display.doneBtn);
        step("Go in Single Block");
        go_until_idle();
        step("Meas page: Repeat, Frequency, OK");
        click(main().MeasBtn);
        MeasFrm& meas = forms::get<MeasFrm>();
        click_all({meas.RepeatBtn, meas.FreqBtn, meas.doneBtn});
        step("Go in Repeat, three blocks, Stop");
        click(main().GoBtn);
        for (int n = 0; n < 3; ++n)
            tick(tick_seconds);
        if (global::running == global::flag_true)
            click(main().GoBtn);
        step("Meas page: Manual, Single Block, Time, OK");
        click_all({main().MeasBtn, meas.ManualBtn, meas.SingleBtn, meas.TimeBtn, meas.doneBtn});
        step("Go in Manual with the Trigger button");
        click(main().GoBtn);
        tick(tick_seconds);  // the first tick makes Trigger usable
        click(main().TriggerBtn);
        tick_until_idle();
        step("Meas page: Auto, Multi Mainframe, OK");
        click_all({main().MeasBtn, meas.AutoBtn});
        meas.mmcheck->setChecked(true);
        click(meas.doneBtn);
        step("Go across mainframes");
        go_until_idle();
        step("Meas page: one mainframe, OK");
        click(main().MeasBtn);
        meas.mmcheck->setChecked(false);
        click(meas.doneBtn);
        step("Input page OK");
        click(main().InpBtn);
        click(forms::get<InputFrm>().doneBtn);
        step("Source page: Default Values, Apply");
        click(main().SrcBtn);
        SrcFrm& source = forms::get<SrcFrm>();
        click_all({source.PresetBtn, source.ApplyBtn});
        step("Source page: active Arbitrary, Apply, OK");
        source.ActiveCmbo->setEditText("On");
        source.ModeCmbo->setEditText("Arbitrary");
        click_all({source.ApplyBtn, source.doneBtn});
        step("VXI page OK: the session opened again");
        click(main().VxiBtn);
        click(forms::get<VxiFrm>().doneBtn);
    }

    // Marks where a step begins; the function failing_ names fails throughout step number
    // failing_step_ (or every step).
    void step(const char* name) {
        sim::clear_failures();
        if (steps_.size() == failing_step_ || failing_step_ == every_step)
            sim::fail(failing_, failure);
        steps_.emplace_back(name, sim::call_log().size());
    }
    static constexpr size_t no_step = SIZE_MAX, every_step = SIZE_MAX - 1;
    void run_session(size_t failing_step = no_step, const std::string& function = "") {
        failing_step_ = failing_step;
        failing_ = function;
        steps_.clear();
        session();
        step("end");
    }
    // The functions each step of the last session called.
    std::vector<std::set<std::string>> functions_by_step() const {
        std::vector<std::set<std::string>> out(steps_.size() - 1);
        for (size_t s = 0; s + 1 < steps_.size(); ++s)
            for (size_t i = steps_[s].second; i < steps_[s + 1].second; ++i)
                out[s].insert(sim::call_log()[i].name);
        return out;
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
        static const std::regex report("ost7720_32\\.dll: (\\S+ returned -?\\d+) ");
        std::vector<std::string> out;
        std::smatch found;
        for (const Message& m : messages)
            if (m.kind == dialogs::Kind::question)
                out.push_back(std::regex_search(m.text, found, report) ? found[1].str() : m.text);
        return out;
    }

    // What the panel must report for the calls in the log that failed: every failure, in call
    // order, but for the ones it handles itself: the report's own calls, the span (its own
    // message), a positive poll status (no error), and discovery's close and memory query.
    std::vector<std::string> expected_reports() const {
        static const std::set<std::string> never = {"ost7720_error_message", "ost7720_errorDetails",
                                                    "ost7720_setSpan"};
        std::vector<std::string> out;
        const auto& log = sim::call_log();
        for (size_t i = 0; i < log.size(); ++i) {
            const sim::Call& c = log[i];
            const bool handled =
                never.count(c.name) || (c.name == "ost7720_blockAvailable" && c.status > 0) ||
                (i < steps_.at(1).second && (c.name == "ost7720_close" || c.name == "ost7720_getHWConfig"));
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

    std::vector<std::pair<std::string, size_t>> steps_;  // name, first call in the log
    size_t failing_step_ = no_step;
    std::string failing_;
};

TEST_F(FaultSweepTest, EveryCallSiteFailingIsReportedUnderItsNameYesFinishesAndGoStillWorks) {
    run_session();
    EXPECT_EQ(reports(), std::vector<std::string>{});
    expect_go_works();
    const auto steps = steps_;
    const auto clean = functions_by_step();

    std::set<std::string> functions;
    size_t sites = 0;
    for (size_t s = 0; s < clean.size(); ++s) {
        for (const std::string& function : clean[s]) {
            functions.insert(function);
            if (s == 0 && fatal_at_start.count(function))
                continue;  // ends the program
            ++sites;
            SCOPED_TRACE(steps[s].first + ": " + function);
            run_session(s, function);
            const auto& log = sim::call_log();
            const auto failed =
                static_cast<size_t>(std::count_if(log.begin(), log.end(), [&](const sim::Call& c) {
                    return c.name == function && c.status == failure;
                }));
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
            // Yes let the session finish: the main window is back and Go gives a block. A
            // failure that left no usable session when the VXI page opened it last needs that
            // page's OK once more, as a user would do.
            if (s + 1 == clean.size() && session_builders.count(function)) {
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
}

// The first report's No ends the program: nothing after it runs, neither another message nor
// the rest of the session. A function whose failure is never reported (the memory query) or
// shows its own notice (the span) lets the session run on to Exit, which ends the program.
TEST_F(FaultSweepTest, AnsweringNoToAnyReportEndsTheProgramAtOnce) {
    run_session();
    std::set<std::string> functions;
    for (const std::set<std::string>& step : functions_by_step())
        functions.insert(step.begin(), step.end());
    for (const std::string& f : fatal_at_start)
        functions.erase(f);
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
                run_session(every_step, function);
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
