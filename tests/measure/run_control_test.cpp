// Run control on the main window: Go, the block poll, Trigger, the page buttons, and what a
// run leaves in the traces and the output files. Driven through the buttons, on the
// simulator's virtual clock. A file that cannot be written during a run: tests/display.
#include <QTimer>

#include "ost7720.h"
#include "pages/DispFrm.h"
#include "run_fixture.h"

namespace {

using Names = std::vector<std::string>;

// One 1024-point block at the top span takes 1024 / 51200 s.
constexpr double block_seconds = 1024.0 / 51200.0;

class RunControlTest : public RunTest {
  protected:
    void SetUp() override {
        RunTest::SetUp();
        main().Form_Load();
        sim::use_virtual_clock();
        sim::clear_call_log();
    }
    // A tick that finds a block; the Go button's caption and state while it lets events run.
    std::pair<QString, bool> tick_with_block() {
        std::pair<QString, bool> seen;
        QTimer::singleShot(0, [&] { seen = {main().GoBtn->text(), main().GoBtn->isEnabled()}; });
        tick(block_seconds);
        return seen;
    }
};

TEST_F(RunControlTest, SingleBlockGoesStopReadingGoAndRewritesTheFiles) {
    global::trace_file[0] = file("t1.txt");
    { std::ofstream(global::trace_file[0]) << "old contents that must go\r\n"; }
    click(main().GoBtn);
    EXPECT_EQ(main().GoBtn->text(), "Stop");
    EXPECT_EQ(global::running, global::flag_true);
    EXPECT_TRUE(main().MainTimer->isActive());
    EXPECT_EQ(sim::call_names().back(), "ost7720_initMeasure");

    sim::clear_call_log();
    tick(block_seconds / 2);  // not yet
    EXPECT_EQ(sim::call_names(), Names{"ost7720_blockAvailable"});
    EXPECT_EQ(main().GoBtn->text(), "Stop");

    EXPECT_EQ(tick_with_block(), std::make_pair(QString("Reading"), false));
    EXPECT_EQ(main().GoBtn->text(), "Go");
    EXPECT_TRUE(main().GoBtn->isEnabled());
    EXPECT_EQ(global::running, global::flag_false);
    EXPECT_FALSE(main().MainTimer->isActive());
    EXPECT_EQ(calls_to("ost7720_readFloat64Data"), 16u);  // every enabled input, once
    EXPECT_EQ(calls_to("ost7720_getRange"), 1u);          // only the shown channel
    EXPECT_EQ(calls_to("ost7720_resetMeasure"), 1u);
    EXPECT_EQ(global::trace_has_data[0], global::flag_true);
    EXPECT_EQ(lines_in(global::trace_file[0]), 1025u);
    EXPECT_TRUE(messages.empty());
}

TEST_F(RunControlTest, RepeatCyclesCaptionsAndAppendsOneBlockPerBlockUntilStop) {
    global::single_block = global::flag_false;
    global::trace_channel[1] = 5;
    global::trace_file[0] = file("a.txt");
    global::trace_file[1] = file("b.txt");
    click(main().GoBtn);
    for (size_t block = 1; block <= 3; ++block) {
        EXPECT_EQ(tick_with_block().first, "Reading");
        EXPECT_EQ(main().GoBtn->text(), "Stop");
        EXPECT_TRUE(main().MainTimer->isActive());
        EXPECT_EQ(lines_in(file("a.txt")), 1025u * block);
        EXPECT_EQ(lines_in(file("b.txt")), 1025u * block);
    }
    EXPECT_EQ(calls_to("ost7720_initMeasure"), 1u);  // the module's own measurement goes on
    sim::clear_call_log();
    click(main().GoBtn);
    EXPECT_EQ(main().GoBtn->text(), "Go");
    EXPECT_EQ(global::running, global::flag_false);
    EXPECT_FALSE(main().MainTimer->isActive());
    tick(block_seconds);  // a stray tick after Stop does nothing
    EXPECT_EQ(sim::call_names(), Names{"ost7720_resetMeasure"});
    EXPECT_EQ(lines_in(file("a.txt")), 3075u);
}

TEST_F(RunControlTest, ManualTriggerButtonIsUsableOnlyWhileWaiting) {
    global::trigger_source = 1;
    main().run_resize();
    EXPECT_FALSE(main().TriggerBtn->isHidden());
    EXPECT_FALSE(main().TriggerBtn->isEnabled());
    main().TriggerBtn_Click();  // idle: nothing

    click(main().GoBtn);
    EXPECT_FALSE(main().TriggerBtn->isEnabled());
    tick(0);
    ASSERT_TRUE(main().TriggerBtn->isEnabled());
    click(main().TriggerBtn);
    EXPECT_FALSE(main().TriggerBtn->isEnabled());
    click(main().TriggerBtn);  // disabled: no second call
    EXPECT_EQ(calls_to("ost7720_triggerMeasure"), 1u);
    // Triggered by hand: the block is there one block time later.
    tick(block_seconds);
    EXPECT_EQ(global::trace_has_data[0], global::flag_true);
    EXPECT_EQ(main().GoBtn->text(), "Go");
    EXPECT_FALSE(main().TriggerBtn->isEnabled());

    global::trigger_source = 0;
    main().run_resize();
    EXPECT_TRUE(main().TriggerBtn->isHidden());
    click(main().GoBtn);
    tick(0);
    main().TriggerBtn_Click();
    EXPECT_EQ(calls_to("ost7720_triggerMeasure"), 1u);
}

TEST_F(RunControlTest, OnlyANegativePollStatusIsReported) {
    click(main().GoBtn);
    sim::fail("ost7720_blockAvailable", 3, 1);
    tick(0);
    EXPECT_TRUE(messages.empty());
    sim::fail("ost7720_blockAvailable", -1074003951, 1);
    tick(0);
    ASSERT_EQ(messages.size(), 1u);
    EXPECT_NE(messages[0].text.find("ost7720_blockAvailable returned -1074003951"), std::string::npos);
    EXPECT_EQ(global::running, global::flag_true);  // Yes: still waiting
    tick(block_seconds);
    EXPECT_EQ(main().GoBtn->text(), "Go");
}

TEST_F(RunControlTest, PageButtonStopsTheRunBeforeThePageShows) {
    click(main().GoBtn);
    sim::clear_call_log();
    click(main().DispBtn);
    EXPECT_EQ(sim::call_names().front(), "ost7720_resetMeasure");
    EXPECT_EQ(global::running, global::flag_false);
    EXPECT_EQ(main().GoBtn->text(), "Go");
    EXPECT_FALSE(main().MainTimer->isActive());
    EXPECT_TRUE(forms::get<DispFrm>().isVisible());
    EXPECT_FALSE(main().isVisible());
}

TEST_F(RunControlTest, StopDuringReadingDoesNotReadTheResetMeasurement) {
    global::single_block = global::flag_false;
    click(main().GoBtn);
    sim::clear_call_log();
    // The user presses a page button in the moment the tick shows "Reading".
    QTimer::singleShot(0, [&] { main().DispBtn_Click(); });
    tick(block_seconds);
    EXPECT_EQ(calls_to("ost7720_resetMeasure"), 1u);
    EXPECT_EQ(calls_to("ost7720_readFloat64Data"), 0u);
    EXPECT_TRUE(messages.empty());
    EXPECT_EQ(global::running, global::flag_false);
    EXPECT_FALSE(main().MainTimer->isActive());
    EXPECT_EQ(main().GoBtn->text(), "Go");
    EXPECT_TRUE(main().GoBtn->isEnabledTo(&main()));  // usable again when the main window comes back
}

TEST_F(RunControlTest, SharedChannelsAreReadOnceAndOnlyEnabledInputsAreRead) {
    global::trace_channel = {3, 3, 0, 3, 0};
    global::single_block = global::flag_false;
    click(main().GoBtn);
    tick(block_seconds);
    const auto& log = sim::call_log();
    EXPECT_EQ(std::count_if(log.begin(), log.end(),
                            [](const sim::Call& c) {
                                return c.name == "ost7720_readFloat64Data" && c.args.at(1) == "3";
                            }),
              1);
    EXPECT_EQ(global::trace2_data, global::trace1_data);
    EXPECT_EQ(global::trace4_data, global::trace1_data);
    EXPECT_EQ(global::trace_has_data[3], global::flag_true);
    EXPECT_EQ(global::trace_range[1], global::trace_range[0]);
    EXPECT_EQ(global::trace_has_data[2], global::flag_false);
    EXPECT_EQ(global::x_values[0], 1.0f);
    EXPECT_EQ(global::x_values[1023], 1024.0f);

    // A channel whose data kind is off is not read, even when a trace shows it.
    ASSERT_EQ(ost7720_setEnable(global::session, 3, 270, 281), 0);
    sim::clear_call_log();
    tick(block_seconds);
    EXPECT_EQ(calls_to("ost7720_readFloat64Data"), 15u);
    EXPECT_EQ(global::trace_has_data[0], global::flag_false);
}

TEST_F(RunControlTest, FrequencyDomainReadsHalfTheBlock) {
    global::domain = 1;
    click(main().GoBtn);
    tick(block_seconds);
    for (const sim::Call& c : sim::call_log())
        if (c.name == "ost7720_readFloat64Data") {
            EXPECT_EQ(c.args.at(3), "512") << c.line();
        }
    EXPECT_EQ(global::trace1_data.size(), 1025u);
    EXPECT_EQ(global::trace1_data[600], 0.0);
    EXPECT_GT(*std::max_element(global::trace1_data.begin(), global::trace1_data.begin() + 512), 0.5);
}

}  // namespace
