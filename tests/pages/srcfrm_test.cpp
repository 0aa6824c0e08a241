// The Source Setup page and source programming: choosing the source, what a load shows (with the
// hints), Default Values, OK, Apply and Cancel; the one-active-source rule, the arbitrary download
// and its readiness wait, unknown texts and the limits of the numbers; and what the traces show.
#include <gtest/gtest.h>

#include <QFocusEvent>
#include <QSignalBlocker>
#include <algorithm>
#include <cmath>
#include <tuple>

#include "ost7720.h"
#include "page_fixture.h"
#include "pages/SrcFrm.h"

namespace {

constexpr int32_t src1 = 4097;
constexpr int32_t src2 = 4098;
constexpr int32_t src3 = 4099;

// Entries of the arbitrary test waveform, worked by hand: entry k of the ramp is k x 2096679.6875
// before the quarters swap, halves going to the even neighbour.
const std::pair<size_t, int32_t> arb_entries[] = {
    {0, 536750000},   {8, 553523438},    {24, 587070312},   {255, 1071403320}, {256, 0},
    {511, 534653320}, {512, 1610250000}, {767, 2144903320}, {768, 1073500000}, {1023, 1608153320}};

class SrcFrmTest : public PageTest {
  protected:
    // Three modules with one source each. The source at the lowest address powers on active;
    // start-up lists the modules from the highest address, so that is source 3.
    void SetUp() override {
        PageTest::SetUp();
        start({{8, 8, 1, 2, 8}, {16, 8, 1, 0, 32}, {24, 8, 1, 0, 8}});
    }

    SrcFrm& open() {
        main().SrcBtn_Click();
        return forms::get<SrcFrm>();
    }
    // setupsource on a fresh call log.
    static void setup(SrcFrm& page) {
        sim::clear_call_log();
        page.setupsource();
    }
    SrcFrm& open_on(const char* n) {
        SrcFrm& page = open();
        type(page.SrcWhoCmbo, n);
        EXPECT_EQ(text(page.SrcWhoCmbo), n);
        return page;
    }

    static sim::SourceView source(int32_t channel) {
        sim::SourceView view;
        EXPECT_TRUE(sim::read_source(global::session, channel, view));
        return view;
    }
    static void set(int32_t (*setter)(int32_t, int32_t, double), int32_t channel, double value) {
        ASSERT_EQ(setter(global::session, channel, value), 0);
    }
    static void set(int32_t (*setter)(int32_t, int32_t, int32_t), int32_t channel, int32_t value) {
        ASSERT_EQ(setter(global::session, channel, value), 0);
    }
};

TEST_F(SrcFrmTest, TheSourceNumberIsKeptWithinTheSessionsSources) {
    SrcFrm& page = open();
    EXPECT_EQ(items(page.SrcWhoCmbo), (Texts{"1", "2", "3"}));
    EXPECT_EQ(text(page.SrcWhoCmbo), "1");
    struct Case {
        const char* typed;
        const char* shown;
        Texts read;  // the source channels loaded
    };
    // The last: the number shown, nothing to reload.
    const Case cases[] = {{"7", "3", {"getSourceMode(4099)"}},
                          {"0", "1", {"getSourceMode(4097)"}},
                          {"2", "2", {"getSourceMode(4098)"}},
                          {"x", "1", {"getSourceMode(4097)"}},
                          {"1", "1", {}}};
    for (const Case& c : cases) {
        SCOPED_TRACE(c.typed);
        sim::clear_call_log();
        type(page.SrcWhoCmbo, c.typed);
        EXPECT_EQ(text(page.SrcWhoCmbo), c.shown);
        EXPECT_EQ(calls({"getSourceMode"}), c.read);
    }

    // 7 comes out as the 3 shown: the text stays while typing, leaving the box shows 3, and OK
    // writes source 3 rather than silently nothing.
    type(page.SrcWhoCmbo, "3");
    type(page.FreqTxt, "1234");
    type(page.SrcWhoCmbo, "7");
    EXPECT_EQ(text(page.SrcWhoCmbo), "7");
    QFocusEvent out(QEvent::FocusOut, Qt::TabFocusReason);
    QCoreApplication::sendEvent(page.SrcWhoCmbo->lineEdit(), &out);
    EXPECT_EQ(text(page.SrcWhoCmbo), "3");
    click(page.doneBtn);
    EXPECT_EQ(source(src3).sine_freq, 1234.0);
    EXPECT_TRUE(messages.empty());
}

TEST_F(SrcFrmTest, WithoutSourcesThePageShowsNoneAndCallsNothing) {
    start({{8, 8, 0, 2, 8}});
    SrcFrm& page = open();
    EXPECT_EQ(page.SrcWhoCmbo->count(), 0);
    EXPECT_EQ(text(page.SrcWhoCmbo), "NONE");
    EXPECT_TRUE(page.NoteTxt->isHidden());
    sim::clear_call_log();
    click(page.PresetBtn);
    type(page.SrcWhoCmbo, "1");
    click(page.ApplyBtn);
    EXPECT_EQ(text(page.SrcWhoCmbo), "NONE");
    click(page.doneBtn);
    EXPECT_TRUE(sim::call_log().empty());
    EXPECT_TRUE(main().isVisible());
    EXPECT_TRUE(messages.empty());
}

TEST_F(SrcFrmTest, EverySixHintsInOrderAndNoneAtTheirBoundaries) {
    set(ost7720_setActive, src1, 421);
    set(ost7720_setSourceOutput, src1, 701);
    set(ost7720_setRampRate, src1, 2.5);
    set(ost7720_setRange, src1, 0.5);
    set(ost7720_setSineFreq, src1, 50.0);
    set(ost7720_setDutyCycle, src1, 0.25);
    SrcFrm& page = open();
    EXPECT_TRUE(page.NoteTxt->isVisible());
    EXPECT_FALSE(page.NoteTxt->isEnabled());
    EXPECT_EQ(page.NoteTxt->toPlainText().toStdString(),
              "No Source?  Try:\nOutput -> Normal\nActive -> On\nRampRate -> 0\nRange -> higher\n"
              "Freq -> higher\nDuty Cycle -> 1");

    set(ost7720_setActive, src1, 420);
    set(ost7720_setSourceOutput, src1, 700);
    set(ost7720_setRampRate, src1, 0.0);
    set(ost7720_setRange, src1, 1.0);
    set(ost7720_setSineFreq, src1, 100.0);
    click(page.cancelBtn);
    EXPECT_EQ(open().NoteTxt->toPlainText().toStdString(), "No Source?  Try:\nDuty Cycle -> 1");
    set(ost7720_setDutyCycle, src1, 0.5);
    click(page.cancelBtn);
    EXPECT_TRUE(open().NoteTxt->isHidden());
    EXPECT_TRUE(messages.empty());
}

TEST_F(SrcFrmTest, LoadingShowsWhatTheSourceHoldsPastAFailedReadAndAfterDefaultValues) {
    set(ost7720_setTriggerChannel, src2, 420);
    set(ost7720_setSourceMode, src2, 175);
    set(ost7720_setSourceOutput, src2, 704);
    set(ost7720_setSourceCola, src2, 181);
    set(ost7720_setSourceSum, src2, 191);
    set(ost7720_setSinePhase, src2, -90.25);
    set(ost7720_setSourceSeed, src2, 200);
    set(ost7720_setRange, src2, 7.5);
    SrcFrm& page = open_on("2");
    auto shown = [&page] {
        return Texts{text(page.ActiveCmbo),  text(page.SrcTrigCmbo), text(page.ModeCmbo),
                     text(page.OutputCmbo),  text(page.ColaCmbo),    text(page.SumCmbo),
                     text(page.RampRateTxt), text(page.FreqTxt),     text(page.PhaseTxt),
                     text(page.SeedTxt),     text(page.RangeTxt),    text(page.DutyTxt)};
    };
    EXPECT_EQ(shown(), (Texts{"Off", "On", "Burst Zoom Random", "Multi", "On", "On", "0", "1000", "-90.25",
                              "200", "7.5", "1"}));

    // A read that fails is reported under its name; its box keeps its text, the others load.
    page.FreqTxt->setText(QStringLiteral("kept"));
    sim::fail("ost7720_getSineFreq", -1074001, 1);
    type(page.SrcWhoCmbo, "3");
    ASSERT_EQ(messages.size(), 1u);
    EXPECT_NE(messages[0].text.find("ost7720_getSineFreq returned -1074001"), std::string::npos);
    EXPECT_EQ(shown(), (Texts{"On", "Off", "Sine", "Normal", "Off", "Off", "0", "kept", "0", "1", "1", "1"}));

    // Default Values presets the source shown and reloads it.
    type(open_on("2").FreqTxt, "9999");
    sim::clear_call_log();
    click(page.PresetBtn);
    EXPECT_EQ(calls({"preset", "getSourceMode"}), (Texts{"preset(4098)", "getSourceMode(4098)"}));
    EXPECT_EQ(shown(),
              (Texts{"Off", "Off", "Sine", "Normal", "Off", "Off", "0", "1000", "0", "1", "1", "1"}));
    EXPECT_TRUE(page.isVisible());
}

TEST_F(SrcFrmTest, OkWritesAndReturnsApplyStaysReloadedCancelWritesNothing) {
    SrcFrm& page = open();
    type(page.FreqTxt, "2000");
    sim::clear_call_log();
    click(page.ApplyBtn);
    EXPECT_TRUE(page.isVisible());
    EXPECT_EQ(source(src1).sine_freq, 2000.0);
    // Written, read back, written again as read back, then laid out and read once more.
    EXPECT_EQ(calls({"setSineFreq", "getSineFreq"}), (Texts{"setSineFreq(4097, 2000)", "getSineFreq(4097)",
                                                            "setSineFreq(4097, 2000)", "getSineFreq(4097)"}));

    // An edit is dropped by a resize, and by Cancel.
    type(page.FreqTxt, "3000");
    page.resize(880, 690);
    EXPECT_EQ(text(page.FreqTxt), "2000");
    type(page.FreqTxt, "3000");
    sim::clear_call_log();
    click(page.cancelBtn);
    EXPECT_TRUE(main().isVisible());
    EXPECT_TRUE(sim::call_log().empty());

    type(open().FreqTxt, "3000");
    click(page.doneBtn);
    EXPECT_TRUE(main().isVisible());
    EXPECT_EQ(source(src1).sine_freq, 3000.0);
    // The page reopens on the source it showed last.
    type(open().SrcWhoCmbo, "3");
    click(page.cancelBtn);
    EXPECT_EQ(text(open().SrcWhoCmbo), "3");
}

TEST_F(SrcFrmTest, ListsAndGridAreReadable) {
    SrcFrm& page = open();
    // The codes follow the order of these two lists.
    EXPECT_EQ(items(page.ModeCmbo), (Texts{"Sine", "Burst Sine", "Random", "Burst Random", "Zoom Random",
                                           "Burst Zoom Random", "Arbitrary", "Burst Arbitrary"}));
    EXPECT_EQ(items(page.OutputCmbo), (Texts{"Normal", "Grounded", "Open", "Cal", "Multi"}));
    // 900 x 700 px: columns of 75 px, rows of 700 / 18 px; the first column's fields at 2 columns,
    // the second's at 7, its buttons and hint box at 6.5.
    const double ru = 700.0 / 18;
    EXPECT_EQ(page.SrcTrigCmbo->pos(), QPoint(150, qRound(15 * ru)));
    EXPECT_EQ(page.PresetBtn->pos(), QPoint(488, qRound(ru)));
    EXPECT_EQ(page.ColaCmbo->pos(), QPoint(525, qRound(5 * ru)));
    EXPECT_EQ(page.SeedTxt->pos(), QPoint(525, qRound(11 * ru)));
    EXPECT_EQ(page.NoteTxt->pos(), QPoint(488, qRound(15 * ru)));
    EXPECT_EQ(page_check::layout_faults(&page), Texts{});
    // In a window under 730 px tall the last row would reach OK and Cancel: they clear it.
    click(page.cancelBtn);
    main().resize(853, 600);
    open();
    EXPECT_EQ(page_check::layout_faults(&page), Texts{});
    EXPECT_GE(page.doneBtn->y(), page.SrcTrigCmbo->geometry().bottom());
    EXPECT_LE(page.doneBtn->geometry().bottom(), page.height());
    EXPECT_GE(page.ModeCmbo->width(),
              page.ModeCmbo->fontMetrics().horizontalAdvance("Burst Zoom Random") + 30);
}

TEST_F(SrcFrmTest, SwitchingOnASecondSourceSwitchesAllOthersOff) {
    SrcFrm& page = open_on("2");  // source 3 is on from power-on
    type(page.ActiveCmbo, "On");
    setup(page);
    EXPECT_EQ(notices(), Texts{"Only one source can be enabled\r\n"
                               "This is a limitation of this example program, not the Plug&Play library\r\n"
                               "The C example \"srcgang\" can control on multiple sources\r\n"
                               "\r\n"
                               "Source channel 2 is ON, all others are OFF"});
    EXPECT_EQ(calls({"setActive", "getActive"}),
              (Texts{"setActive(4098, 420)", "getActive(4097)", "getActive(4098)", "getActive(4099)",
                     "setActive(4097, 421)", "setActive(4098, 421)", "setActive(4099, 421)",
                     "setActive(4098, 420)"}));
    EXPECT_EQ(source(src3).active, 421);

    // With no other source on, no message: OK switches source 3 on quietly.
    messages.clear();
    type(page.ActiveCmbo, "Off");
    page.setupsource();
    type(page.SrcWhoCmbo, "3");
    type(page.ActiveCmbo, "On");
    click(page.doneBtn);
    EXPECT_TRUE(messages.empty());
    EXPECT_EQ(source(src2).active, 421);
    EXPECT_EQ(source(src3).active, 420);
}

TEST_F(SrcFrmTest, AnActiveArbitrarySourceGetsTheTestWaveform) {
    SrcFrm& page = open_on("3");
    type(page.ActiveCmbo, "On");
    type(page.ModeCmbo, "Arbitrary");
    setup(page);
    EXPECT_EQ(calls({"setSourceMode", "setAmpScale", "setSourceBlocksize", "setSrcBuffer", "checkSrcArbRdy",
                     "writeSrcBufferData", "setSourceOutput"}),
              (Texts{"setSourceMode(4099, 176)", "setAmpScale(4099, 1)", "setSourceBlocksize(4099, 1024)",
                     "setSrcBufferSize(4099, 1024)", "setSrcBufferMode(4099, 4)", "setSrcBufferInit(4099, 1)",
                     // the simulated buffer is ready at its third poll
                     "checkSrcArbRdy(4099, 4)", "checkSrcArbRdy(4099, 4)", "checkSrcArbRdy(4099, 4)",
                     "writeSrcBufferData(4099, [1024], 1024, 4)", "setSourceOutput(4099, 700)"}));
    const std::vector<int32_t> table = source(src3).table;
    ASSERT_EQ(table.size(), 1024u);
    for (const auto& [i, value] : arb_entries)
        EXPECT_EQ(table[i], value) << i;
    for (size_t i = 1; i < 1024; ++i) {
        const int32_t step = table[i] - table[i - 1];
        EXPECT_TRUE(i % 256 == 0 || step == 2096679 || step == 2096680) << i;
    }
    // Burst Arbitrary too; but a source left off, or in another mode, gets nothing.
    for (const auto& [active, mode, downloads] :
         {std::tuple{"On", "Burst Arbitrary", 1}, std::tuple{"Off", "Arbitrary", 0},
          std::tuple{"On", "Random", 0}}) {
        type(page.ActiveCmbo, active);
        type(page.ModeCmbo, mode);
        setup(page);
        EXPECT_EQ(count("setAmpScale") + count("setSrcBufferInit") + count("writeSrcBufferData"),
                  3 * downloads)
            << mode;
    }
    EXPECT_TRUE(messages.empty());
}

TEST_F(SrcFrmTest, TheReadinessWaitGivesUpAfterAHundredThousandPolls) {
    SrcFrm& page = open_on("3");
    type(page.ActiveCmbo, "On");
    type(page.ModeCmbo, "Arbitrary");
    // Ready at the last poll allowed: downloaded, no message.
    sim::set_arb_ready_polls(100000);
    setup(page);
    EXPECT_EQ(count("checkSrcArbRdy"), 100000);
    EXPECT_EQ(count("writeSrcBufferData"), 1);
    EXPECT_TRUE(messages.empty());

    // One poll short: the message, no download, and the settings after it still go out.
    sim::set_arb_ready_polls(100001);
    setup(page);
    EXPECT_EQ(count("checkSrcArbRdy"), 100000);
    EXPECT_EQ(count("writeSrcBufferData"), 0);
    EXPECT_EQ(notices(), Texts{"The arbritray source is refusing to take data"});
    EXPECT_EQ(count("setDutyCycle"), 1);

    // A readiness check that fails is reported once and ends the wait the same way.
    sim::fail("ost7720_checkSrcArbRdy", -1074001);
    messages.clear();
    setup(page);
    EXPECT_EQ(count("checkSrcArbRdy"), 1);
    EXPECT_EQ(count("writeSrcBufferData"), 0);
    ASSERT_EQ(messages.size(), 2u);
    EXPECT_NE(messages[0].text.find("ost7720_checkSrcArbRdy returned -1074001"), std::string::npos);
    EXPECT_EQ(messages[1].text, "The arbritray source is refusing to take data");
}

TEST_F(SrcFrmTest, UnknownTextsGetTheirMessageAndNoCallOfAnotherSetting) {
    SrcFrm& page = open_on("1");
    type(page.ActiveCmbo, "on");
    type(page.SrcTrigCmbo, "Yes");
    type(page.ModeCmbo, "Square");
    type(page.OutputCmbo, "Float");
    type(page.SumCmbo, "off");
    type(page.ColaCmbo, "");
    setup(page);
    EXPECT_EQ(notices(),
              (Texts{"bad active string", "bad trig active string", "Unknown source mode Square - ignored",
                     "Unknown source output Float - ignored", "bad src sum string", "bad cola string"}));
    // An unknown mode becomes Sine; the others make no call.
    EXPECT_EQ(calls({"setActive", "setTriggerChannel", "setSourceMode", "setSourceOutput", "setSourceSum",
                     "setSourceCola", "setDutyCycle"}),
              (Texts{"setSourceMode(4097, 170)", "setDutyCycle(4097, 1)"}));

    // Nor for the chosen source when the one-source rule reads the active text again.
    set(ost7720_setActive, src1, 420);
    type(page.SrcWhoCmbo, "2");
    type(page.ActiveCmbo, "ON");
    messages.clear();
    setup(page);
    const Texts shown = notices();
    ASSERT_EQ(shown.size(), 3u);
    EXPECT_EQ(shown[0], "bad active string");
    EXPECT_EQ(shown[2], "bad active string");
    EXPECT_EQ(calls({"setActive"}),
              (Texts{"setActive(4097, 421)", "setActive(4098, 421)", "setActive(4099, 421)"}));
}

TEST_F(SrcFrmTest, NumbersAreBroughtWithinTheirLimitsAndGoOutInOrder) {
    struct Case {
        Texts typed;  // ramp rate, frequency, phase, seed, range, duty cycle
        Texts sent;
    };
    const Case cases[] = {
        {{"-5", "30000", "-720", "300", "25", "1.5"}, {"0", "25600", "-360", "255", "20", "1"}},
        {{"250", "1E999", "-1E999", "2.5", "", "-.5"}, {"100", "25600", "-360", "2", "0", "0"}},
        {{"2.5 s", "", "360", "3.5", "7.5", ".25"}, {"2.5", "0", "360", "4", "7.5", "0.25"}},
        {{"", "100", "", "-1", "0.5", ""}, {"0", "100", "0", "0", "0.5", "0"}},
    };
    SrcFrm& page = open_on("1");
    QLineEdit* boxes[] = {page.RampRateTxt, page.FreqTxt,  page.PhaseTxt,
                          page.SeedTxt,     page.RangeTxt, page.DutyTxt};
    const char* names[] = {"setRampRate",   "setSineFreq", "setSinePhase",
                           "setSourceSeed", "setRange",    "setDutyCycle"};
    for (const Case& c : cases) {
        Texts expected;
        for (size_t i = 0; i < 6; ++i) {
            type(boxes[i], c.typed[i].c_str());
            expected.push_back(names[i] + ("(4097, " + c.sent[i]) + ")");
        }
        setup(page);
        // After the switches: the last calls, in this order.
        const Texts sent = calls({"set"});
        ASSERT_EQ(sent.size(), 12u);
        EXPECT_EQ(Texts(sent.end() - 6, sent.end()), expected);
    }
}

TEST_F(SrcFrmTest, ASourceNumberOutOfRangeWritesNothing) {
    SrcFrm& page = open_on("3");
    // Texts the box can hold between two checks.
    auto write_with = [&page](const char* typed) {
        QSignalBlocker quiet(page.SrcWhoCmbo);
        page.SrcWhoCmbo->setEditText(QString::fromUtf8(typed));
        setup(page);
    };
    for (const char* typed : {"NONE", "0", "4", "3.5", "65537", "-1"}) {
        write_with(typed);
        EXPECT_TRUE(sim::call_log().empty()) << typed;
    }
    EXPECT_TRUE(messages.empty());
    write_with("2.5");  // rounds to the even 2
    EXPECT_EQ(calls({"setSourceMode"}), Texts{"setSourceMode(4098, 170)"});
}

// End to end: what the page sets is what input 1 shows after Go. At span 20000 Hz a block of
// 1024 samples lasts 1024 / 51200 s = 20 ms.
TEST_F(SrcFrmTest, WhatThePageSetsIsWhatTheTracesShowAfterGo) {
    sim::use_virtual_clock();
    auto one_block = [this] {
        click(main().GoBtn);
        sim::advance_clock(1024.0 / 51200.0);
        main().MainTimer_Timer();
        return global::trace1_data;
    };
    SrcFrm& page = open_on("3");
    type(page.FreqTxt, "2000");
    click(page.doneBtn);
    std::vector<double> trace = one_block();
    ASSERT_GE(trace.size(), 1024u);
    // Two periods per ms: 40 rising zero crossings in 20 ms, one fewer by where the block starts.
    int rising = 0;
    for (size_t i = 1; i < 1024; ++i)
        rising += trace[i - 1] < 0 && trace[i] >= 0 ? 1 : 0;
    EXPECT_GE(rising, 39);
    EXPECT_LE(rising, 40);
    EXPECT_NEAR(*std::max_element(trace.begin(), trace.begin() + 1024), 1.0, 0.02);

    // Arbitrary: the swapped-quarter ramp, one entry a sample, entry v showing as v / 2^31 V at
    // range 1, from wherever in the table the block starts.
    open();
    type(page.ModeCmbo, "Arbitrary");
    click(page.doneBtn);
    EXPECT_TRUE(messages.empty());
    trace = one_block();
    ASSERT_GE(trace.size(), 1024u);
    double best = 1e9;
    for (size_t start = 0; start < 1024; ++start) {
        double worst = 0;
        for (const auto& [at, value] : arb_entries)
            worst = std::max(worst, std::abs(trace[(at + 1024 - start) % 1024] - value / 2147483648.0));
        best = std::min(best, worst);
    }
    EXPECT_LT(best, 0.01);
}

}  // namespace
