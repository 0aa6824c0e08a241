// Source programming: the one-active-source rule, the arbitrary download and its readiness
// wait, unknown texts, the limits of the numeric settings and the test waveform.
#include <gtest/gtest.h>

#include <QSignalBlocker>
#include <QTest>
#include <algorithm>
#include <cmath>
#include <limits>
#include <string>
#include <vector>

#include "core/global.h"
#include "core/windows.h"
#include "display/MainFrm.h"
#include "ost7720.h"
#include "pages/SrcFrm.h"
#include "pages/source_programming.h"
#include "panel_fixture.h"

namespace {

constexpr int32_t src1 = 4097;
constexpr int32_t src2 = 4098;
constexpr int32_t src3 = 4099;

using Lines = std::vector<std::string>;

class SetupsourceTest : public PanelTest {
  protected:
    // Three modules with one source each. The source at the lowest address powers on active;
    // start-up lists the modules from the highest address, so that is source 3.
    void SetUp() override {
        PanelTest::SetUp();
        use_system({{8, 8, 1, 2, 8}, {16, 8, 1, 0, 32}, {24, 8, 1, 0, 8}});
        forms::get<MainFrm>().Form_Load();
        forms::get<MainFrm>().resize(900, 700);
    }

    // The page as the Source button opens it, showing source n.
    SrcFrm& open_on(int n) {
        SrcFrm& page = forms::get<SrcFrm>();
        switch_page(forms::main_form(), page);
        page.SrcWhoCmbo->setEditText(QString::number(n));
        EXPECT_EQ(page.cur_src, n);
        return page;
    }

    static void put(QComboBox* box, const char* text) { box->setEditText(QString::fromUtf8(text)); }
    static void put(QLineEdit* box, const char* text) { box->setText(QString::fromUtf8(text)); }

    // Each call of the log as "name(channel, value)", for the calls named.
    static Lines calls(const std::vector<std::string>& names) {
        Lines out;
        for (const sim::Call& c : sim::call_log())
            for (const std::string& n : names)
                if (c.name == n)
                    out.push_back(c.name + "(" + c.args.at(1) +
                                  (c.args.size() > 2 ? ", " + c.args.at(2) : "") + ")");
        return out;
    }

    static int count(const std::string& name) {
        int n = 0;
        for (const sim::Call& c : sim::call_log())
            n += c.name == name ? 1 : 0;
        return n;
    }

    static sim::SourceView source(int32_t channel) {
        sim::SourceView view;
        EXPECT_TRUE(sim::read_source(global::session, channel, view));
        return view;
    }

    Lines notices() const {
        Lines out;
        for (const Message& m : messages)
            if (m.kind == dialogs::Kind::notice)
                out.push_back(m.text);
        return out;
    }
};

TEST(ArbTestWaveform, SwappedQuarterRampWithHalvesRoundedToEven) {
    const auto table = arb_test_waveform();
    // Worked by hand: entry k of the ramp is k x 2096679.6875 before the swap.
    EXPECT_EQ(table[0], 536750000);     // ramp entry 256
    EXPECT_EQ(table[8], 553523438);     // 264: ...437.5 goes to the even ...438
    EXPECT_EQ(table[24], 587070312);    // 280: ...312.5 goes to the even ...312
    EXPECT_EQ(table[255], 1071403320);  // 511
    EXPECT_EQ(table[256], 0);
    EXPECT_EQ(table[511], 534653320);  // 255
    EXPECT_EQ(table[512], 1610250000);
    EXPECT_EQ(table[767], 2144903320);  // 1023, the largest
    EXPECT_EQ(table[768], 1073500000);
    EXPECT_EQ(table[1023], 1608153320);
    // Within each quarter the ramp rises by 2096679.6875 a step, so by one of its two neighbours.
    for (size_t q = 0; q < 4; ++q)
        for (size_t i = 1; i < 256; ++i) {
            const int32_t step = table[q * 256 + i] - table[q * 256 + i - 1];
            EXPECT_TRUE(step == 2096679 || step == 2096680) << q << " " << i;
        }
    EXPECT_EQ(*std::max_element(table.begin(), table.end()), 2144903320);
}

TEST(SourceLimit, LimitsPassAndWhatIsNoNumberTakesTheLowerOne) {
    EXPECT_EQ(source_limit(-5, 0, 100), 0);
    EXPECT_EQ(source_limit(250, 0, 100), 100);
    EXPECT_EQ(source_limit(-360, -360, 360), -360);
    EXPECT_EQ(source_limit(360, -360, 360), 360);
    EXPECT_EQ(source_limit(0.25, 0, 1), 0.25);
    EXPECT_EQ(source_limit(std::numeric_limits<double>::infinity(), 0, 25600), 25600);
    EXPECT_EQ(source_limit(-std::numeric_limits<double>::infinity(), -360, 360), -360);
    EXPECT_EQ(source_limit(std::nan(""), -360, 360), -360);
}

TEST_F(SetupsourceTest, SwitchingOnASecondSourceSwitchesAllOthersOff) {
    ASSERT_EQ(ost7720_setActive(global::session, src3, 421), 0);
    ASSERT_EQ(ost7720_setActive(global::session, src1, 420), 0);
    SrcFrm& page = open_on(2);
    put(page.ActiveCmbo, "On");
    sim::clear_call_log();
    page.setupsource();
    ASSERT_EQ(notices().size(), 1u);
    EXPECT_EQ(notices()[0],
              "Only one source can be enabled\r\n"
              "This is a limitation of this example program, not the Plug&Play library\r\n"
              "The C example \"srcgang\" can control on multiple sources\r\n"
              "\r\n"
              "Source channel 2 is ON, all others are OFF");
    EXPECT_EQ(
        calls({"ost7720_setActive", "ost7720_getActive"}),
        (Lines{"ost7720_setActive(4098, 420)", "ost7720_getActive(4097)", "ost7720_getActive(4098)",
               "ost7720_getActive(4099)", "ost7720_setActive(4097, 421)", "ost7720_setActive(4098, 421)",
               "ost7720_setActive(4099, 421)", "ost7720_setActive(4098, 420)"}));
    EXPECT_EQ(source(src1).active, 421);
    EXPECT_EQ(source(src2).active, 420);
    EXPECT_EQ(source(src3).active, 421);

    // With no other source on, no message: OK's two passes switch source 3 on quietly.
    messages.clear();
    put(page.ActiveCmbo, "Off");
    page.setupsource();
    page.SrcWhoCmbo->setEditText(QStringLiteral("3"));
    put(page.ActiveCmbo, "On");
    QTest::mouseClick(page.doneBtn, Qt::LeftButton);
    EXPECT_TRUE(messages.empty());
    EXPECT_EQ(source(src2).active, 421);
    EXPECT_EQ(source(src3).active, 420);
}

TEST_F(SetupsourceTest, AnActiveArbitrarySourceGetsTheTestWaveform) {
    SrcFrm& page = open_on(3);
    put(page.ActiveCmbo, "On");
    put(page.ModeCmbo, "Arbitrary");
    sim::clear_call_log();
    page.setupsource();
    EXPECT_EQ(calls({"ost7720_setSourceMode", "ost7720_setAmpScale", "ost7720_setSourceBlocksize",
                     "ost7720_setSrcBufferSize", "ost7720_setSrcBufferMode", "ost7720_setSrcBufferInit",
                     "ost7720_checkSrcArbRdy", "ost7720_writeSrcBufferData", "ost7720_setSourceOutput"}),
              (Lines{"ost7720_setSourceMode(4099, 176)", "ost7720_setAmpScale(4099, 1)",
                     "ost7720_setSourceBlocksize(4099, 1024)", "ost7720_setSrcBufferSize(4099, 1024)",
                     "ost7720_setSrcBufferMode(4099, 4)", "ost7720_setSrcBufferInit(4099, 1)",
                     // the simulated buffer is ready at its third poll
                     "ost7720_checkSrcArbRdy(4099, 4)", "ost7720_checkSrcArbRdy(4099, 4)",
                     "ost7720_checkSrcArbRdy(4099, 4)", "ost7720_writeSrcBufferData(4099, [1024])",
                     "ost7720_setSourceOutput(4099, 700)"}));
    for (const sim::Call& c : sim::call_log()) {
        if (c.name == "ost7720_writeSrcBufferData") {
            EXPECT_EQ(c.args, (Lines{c.args[0], "4099", "[1024]", "1024", "4"}));
        }
    }
    const sim::SourceView held = source(src3);
    ASSERT_EQ(held.table.size(), 1024u);
    EXPECT_EQ(held.table[0], 536750000);
    EXPECT_EQ(held.table[8], 553523438);
    EXPECT_EQ(held.table[256], 0);
    EXPECT_EQ(held.table[767], 2144903320);
    EXPECT_EQ(held.table[1023], 1608153320);
    EXPECT_EQ(held.mode, 176);
    EXPECT_TRUE(messages.empty());

    // Burst Arbitrary too; but a source left off gets nothing.
    put(page.ModeCmbo, "Burst Arbitrary");
    sim::clear_call_log();
    page.setupsource();
    EXPECT_EQ(count("ost7720_writeSrcBufferData"), 1);
    put(page.ActiveCmbo, "Off");
    sim::clear_call_log();
    page.setupsource();
    EXPECT_EQ(calls({"ost7720_setSourceMode"}), Lines{"ost7720_setSourceMode(4099, 177)"});
    for (const char* name : {"ost7720_setAmpScale", "ost7720_setSrcBufferInit", "ost7720_checkSrcArbRdy",
                             "ost7720_writeSrcBufferData"})
        EXPECT_EQ(count(name), 0) << name;
    // Nor does an active source in another mode.
    put(page.ActiveCmbo, "On");
    put(page.ModeCmbo, "Random");
    sim::clear_call_log();
    page.setupsource();
    EXPECT_EQ(count("ost7720_setAmpScale"), 0);
    EXPECT_TRUE(messages.empty());
}

TEST_F(SetupsourceTest, TheReadinessWaitGivesUpAfterAHundredThousandPolls) {
    SrcFrm& page = open_on(3);
    put(page.ActiveCmbo, "On");
    put(page.ModeCmbo, "Arbitrary");

    // Ready at the last poll allowed: downloaded, no message.
    sim::set_arb_ready_polls(100000);
    sim::clear_call_log();
    page.setupsource();
    EXPECT_EQ(count("ost7720_checkSrcArbRdy"), 100000);
    EXPECT_EQ(count("ost7720_writeSrcBufferData"), 1);
    EXPECT_TRUE(messages.empty());

    // One poll short: one message, no download, and the rest of the settings still go out.
    sim::set_arb_ready_polls(100001);
    sim::clear_call_log();
    page.setupsource();
    EXPECT_EQ(count("ost7720_checkSrcArbRdy"), 100000);
    EXPECT_EQ(count("ost7720_writeSrcBufferData"), 0);
    EXPECT_EQ(notices(), Lines{"The arbritray source is refusing to take data"});
    for (const char* name : {"ost7720_setSourceOutput", "ost7720_setSourceSum", "ost7720_setSourceCola",
                             "ost7720_setRampRate", "ost7720_setSineFreq", "ost7720_setSinePhase",
                             "ost7720_setSourceSeed", "ost7720_setRange", "ost7720_setDutyCycle"})
        EXPECT_EQ(count(name), 1) << name;
    EXPECT_TRUE(source(src3).table.empty());

    // A readiness check that fails is reported once and ends the wait the same way.
    sim::set_arb_ready_polls(3);
    sim::fail("ost7720_checkSrcArbRdy", -1074001);
    messages.clear();
    sim::clear_call_log();
    page.setupsource();
    EXPECT_EQ(count("ost7720_checkSrcArbRdy"), 1);
    EXPECT_EQ(count("ost7720_writeSrcBufferData"), 0);
    ASSERT_EQ(messages.size(), 2u);
    EXPECT_EQ(messages[0].kind, dialogs::Kind::question);
    EXPECT_NE(messages[0].text.find("ost7720_checkSrcArbRdy returned -1074001"), std::string::npos);
    EXPECT_EQ(messages[1].text, "The arbritray source is refusing to take data");
    EXPECT_EQ(count("ost7720_setDutyCycle"), 1);
}

TEST_F(SetupsourceTest, UnknownTextsGetTheirMessageAndNoCallOfAnotherSetting) {
    SrcFrm& page = open_on(1);
    put(page.ActiveCmbo, "on");
    put(page.SrcTrigCmbo, "Yes");
    put(page.ModeCmbo, "Square");
    put(page.OutputCmbo, "Float");
    put(page.SumCmbo, "off");
    put(page.ColaCmbo, "");
    sim::clear_call_log();
    page.setupsource();
    EXPECT_EQ(notices(),
              (Lines{"bad active string", "bad trig active string", "Unknown source mode Square - ignored",
                     "Unknown source output Float - ignored", "bad src sum string", "bad cola string"}));
    for (const char* name : {"ost7720_setActive", "ost7720_setTriggerChannel", "ost7720_setSourceOutput",
                             "ost7720_setSourceSum", "ost7720_setSourceCola"})
        EXPECT_EQ(count(name), 0) << name;
    EXPECT_EQ(calls({"ost7720_setSourceMode"}), Lines{"ost7720_setSourceMode(4097, 170)"});
    EXPECT_EQ(count("ost7720_getActive"), 3);
    EXPECT_EQ(count("ost7720_setDutyCycle"), 1);

    // The active state read again under the one-source rule: no call for the chosen source.
    ASSERT_EQ(ost7720_setActive(global::session, src1, 420), 0);
    page.SrcWhoCmbo->setEditText(QStringLiteral("2"));
    put(page.ActiveCmbo, "ON");
    messages.clear();
    sim::clear_call_log();
    page.setupsource();
    const Lines shown = notices();
    ASSERT_EQ(shown.size(), 3u);
    EXPECT_EQ(shown[0], "bad active string");
    EXPECT_NE(shown[1].find("Source channel 2 is ON, all others are OFF"), std::string::npos);
    EXPECT_EQ(shown[2], "bad active string");
    EXPECT_EQ(calls({"ost7720_setActive"}),
              (Lines{"ost7720_setActive(4097, 421)", "ost7720_setActive(4098, 421)",
                     "ost7720_setActive(4099, 421)"}));
}

TEST_F(SetupsourceTest, NumbersAreBroughtWithinTheirLimits) {
    struct Case {
        QLineEdit* SrcFrm::*box;
        const char* text;
        const char* function;
        const char* sent;
    };
    const std::vector<Case> cases = {
        {&SrcFrm::RampRateTxt, "-5", "ost7720_setRampRate", "0"},
        {&SrcFrm::RampRateTxt, "250", "ost7720_setRampRate", "100"},
        {&SrcFrm::RampRateTxt, "2.5 s", "ost7720_setRampRate", "2.5"},
        {&SrcFrm::RampRateTxt, "", "ost7720_setRampRate", "0"},
        {&SrcFrm::FreqTxt, "30000", "ost7720_setSineFreq", "25600"},
        {&SrcFrm::FreqTxt, "1E999", "ost7720_setSineFreq", "25600"},
        {&SrcFrm::FreqTxt, "", "ost7720_setSineFreq", "0"},
        {&SrcFrm::PhaseTxt, "-720", "ost7720_setSinePhase", "-360"},
        {&SrcFrm::PhaseTxt, "360", "ost7720_setSinePhase", "360"},
        {&SrcFrm::PhaseTxt, "", "ost7720_setSinePhase", "0"},
        {&SrcFrm::SeedTxt, "300", "ost7720_setSourceSeed", "255"},
        {&SrcFrm::SeedTxt, "2.5", "ost7720_setSourceSeed", "2"},
        {&SrcFrm::SeedTxt, "3.5", "ost7720_setSourceSeed", "4"},
        {&SrcFrm::SeedTxt, "-1", "ost7720_setSourceSeed", "0"},
        {&SrcFrm::SeedTxt, "", "ost7720_setSourceSeed", "0"},
        {&SrcFrm::RangeTxt, "25", "ost7720_setRange", "20"},
        {&SrcFrm::RangeTxt, "", "ost7720_setRange", "0"},
        {&SrcFrm::DutyTxt, "1.5", "ost7720_setDutyCycle", "1"},
        {&SrcFrm::DutyTxt, "-.5", "ost7720_setDutyCycle", "0"},
        {&SrcFrm::DutyTxt, "", "ost7720_setDutyCycle", "0"},
    };
    SrcFrm& page = open_on(1);
    for (const Case& c : cases) {
        page.load_controls();
        put(page.*(c.box), c.text);
        sim::clear_call_log();
        page.setupsource();
        EXPECT_EQ(calls({c.function}), Lines{std::string(c.function) + "(4097, " + c.sent + ")"})
            << '"' << c.text << '"';
        // The text box is not rewritten.
        EXPECT_EQ((page.*(c.box))->text().toStdString(), c.text);
    }
    // The numbers go out in this order, after the switches.
    sim::clear_call_log();
    page.setupsource();
    std::vector<std::string> order;
    for (const sim::Call& c : sim::call_log())
        if (c.name.rfind("ost7720_set", 0) == 0)
            order.push_back(c.name);
    EXPECT_EQ(order, (Lines{"ost7720_setActive", "ost7720_setTriggerChannel", "ost7720_setSourceMode",
                            "ost7720_setSourceOutput", "ost7720_setSourceSum", "ost7720_setSourceCola",
                            "ost7720_setRampRate", "ost7720_setSineFreq", "ost7720_setSinePhase",
                            "ost7720_setSourceSeed", "ost7720_setRange", "ost7720_setDutyCycle"}));
}

TEST_F(SetupsourceTest, ASourceNumberOutOfRangeWritesNothing) {
    SrcFrm& page = open_on(3);
    for (const char* text : {"NONE", "0", "4", "3.5", "70000", "-1"}) {
        {
            // As the box can hold it between two checks.
            QSignalBlocker quiet(page.SrcWhoCmbo);
            page.SrcWhoCmbo->setEditText(QString::fromUtf8(text));
        }
        sim::clear_call_log();
        page.setupsource();
        EXPECT_TRUE(sim::call_log().empty()) << text;
    }
    EXPECT_EQ(page.cur_src, -1);
    EXPECT_TRUE(messages.empty());
    // 2.5 rounds to the even 2.
    {
        QSignalBlocker quiet(page.SrcWhoCmbo);
        page.SrcWhoCmbo->setEditText(QStringLiteral("2.5"));
    }
    sim::clear_call_log();
    page.setupsource();
    EXPECT_EQ(page.cur_src, 2);
    EXPECT_EQ(calls({"ost7720_setSourceMode"}), Lines{"ost7720_setSourceMode(4098, 170)"});
}

// End to end on the simulator: what the Source page sets is what input 1 shows after Go. At
// span 20000 Hz a block of 1024 samples lasts 1024 / 51200 s = 20 ms.
TEST_F(SetupsourceTest, WhatThePageSetsIsWhatTheTracesShowAfterGo) {
    constexpr double block_seconds = 1024.0 / 51200.0;
    MainFrm& main = forms::get<MainFrm>();
    sim::use_virtual_clock();
    auto one_block = [&main] {
        QTest::mouseClick(main.GoBtn, Qt::LeftButton);
        sim::advance_clock(block_seconds);
        main.MainTimer_Timer();
        return global::trace1_data;
    };

    SrcFrm& page = open_on(3);
    put(page.FreqTxt, "2000");
    QTest::mouseClick(page.doneBtn, Qt::LeftButton);
    ASSERT_TRUE(main.isVisible());
    std::vector<double> trace = one_block();
    ASSERT_GE(trace.size(), 1024u);
    // Two periods per ms: 40 rising zero crossings in 20 ms (one more or less by where the
    // block starts in a period).
    int rising = 0;
    for (size_t i = 1; i < 1024; ++i)
        rising += trace[i - 1] < 0 && trace[i] >= 0 ? 1 : 0;
    EXPECT_GE(rising, 39);
    EXPECT_LE(rising, 40);
    EXPECT_NEAR(*std::max_element(trace.begin(), trace.begin() + 1024), 1.0, 0.02);

    // Arbitrary: the swapped-quarter ramp, one table entry a sample, entry v showing as
    // v / 2^31 V at range 1; the block starts somewhere in the table.
    switch_page(main, page);
    ASSERT_EQ(page.cur_src, 3);
    put(page.ModeCmbo, "Arbitrary");
    QTest::mouseClick(page.doneBtn, Qt::LeftButton);
    ASSERT_TRUE(main.isVisible());
    EXPECT_TRUE(messages.empty());
    trace = one_block();
    ASSERT_GE(trace.size(), 1024u);
    const double volts = 1.0 / 2147483648.0;
    const int32_t expected[] = {536750000,  553523438,  1071403320, 0,         534653320,
                                1610250000, 2144903320, 1073500000, 1608153320};
    const size_t at[] = {0, 8, 255, 256, 511, 512, 767, 768, 1023};
    double best = 1e9;
    for (size_t start = 0; start < 1024; ++start) {
        double worst = 0;
        for (size_t j = 0; j < std::size(at); ++j) {
            const size_t i = (at[j] + 1024 - start) % 1024;  // the sample that shows entry at[j]
            worst = std::max(worst, std::abs(trace[i] - expected[j] * volts));
        }
        best = std::min(best, worst);
    }
    EXPECT_LT(best, 0.01);
}

}  // namespace
