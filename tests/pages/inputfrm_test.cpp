// The Input Setup page: what it reads when shown, what OK sends to one channel or to all inputs,
// the refusals, checked against the simulator's call log and the settings it keeps.
#include <gtest/gtest.h>

#include <QTest>
#include <string>
#include <vector>

#include "core/global.h"
#include "core/windows.h"
#include "display/MainFrm.h"
#include "ost7720.h"
#include "page_readability.h"
#include "pages/InputFrm.h"
#include "panel_fixture.h"

namespace {

using Texts = std::vector<std::string>;

// What one input channel holds in the simulator.
struct Held {
    double range = 0;
    int32_t coupling = 0;
    int32_t filter = 0;
    int32_t slope = 0;
    int32_t trigger = 0;
    int32_t input_mode = 0;
    int32_t trigger_mode = 0;
    double lower = 0;
    double upper = 0;
};

class InputFrmTest : public PanelTest {
  protected:
    void SetUp() override {
        PanelTest::SetUp();
        main().Form_Load();
        sim::clear_call_log();
    }

    MainFrm& main() { return forms::get<MainFrm>(); }
    InputFrm& page() { return forms::get<InputFrm>(); }

    // As the main window's Input button does.
    InputFrm& open_page() {
        switch_page(main(), page());
        return page();
    }

    static void type(QComboBox* box, const char* text) {
        box->lineEdit()->clear();
        QTest::keyClicks(box->lineEdit(), QString::fromUtf8(text));
    }
    static void type(QLineEdit* box, const char* text) {
        box->clear();
        QTest::keyClicks(box, QString::fromUtf8(text));
    }
    static void click(QAbstractButton* b) { QTest::mouseClick(b, Qt::LeftButton); }
    static std::string text(const QComboBox* box) { return box->currentText().toStdString(); }
    static std::string text(const QLineEdit* box) { return box->text().toStdString(); }

    // The calls whose name starts with prefix ("ost7720_set", "ost7720_get") since the log was
    // last cleared, as "setRange(target, value)": every one must carry the panel's session.
    static Texts calls(const std::string& prefix) {
        Texts out;
        for (const sim::Call& c : sim::call_log()) {
            if (c.name.rfind(prefix, 0) != 0)
                continue;
            EXPECT_EQ(c.args.at(0), std::to_string(global::session)) << c.line();
            std::string line = c.name.substr(8) + "(";
            for (size_t i = 1; i < c.args.size(); ++i)
                line += (i > 1 ? ", " : "") + c.args[i];
            out.push_back(line + ")");
        }
        return out;
    }
    static Texts sent() { return calls("ost7720_set"); }

    // The set calls of OK with a given page text, as sent to target.
    Texts ok_with(QComboBox* box, const char* typed) {
        open_page();
        type(box, typed);
        sim::clear_call_log();
        click(page().doneBtn);
        return sent();
    }

    static Held held(int32_t channel) {
        Held h;
        const int32_t s = global::session;
        EXPECT_EQ(ost7720_getRange(s, channel, &h.range), 0);
        EXPECT_EQ(ost7720_getCoupling(s, channel, &h.coupling), 0);
        EXPECT_EQ(ost7720_getAntiAliasDigital(s, channel, &h.filter), 0);
        EXPECT_EQ(ost7720_getTriggerSlope(s, channel, &h.slope), 0);
        EXPECT_EQ(ost7720_getTriggerChannel(s, channel, &h.trigger), 0);
        EXPECT_EQ(ost7720_getInputMode(s, channel, &h.input_mode), 0);
        EXPECT_EQ(ost7720_getTriggerMode(s, channel, &h.trigger_mode), 0);
        EXPECT_EQ(ost7720_getTriggerLevel(s, channel, 416, &h.lower), 0);
        EXPECT_EQ(ost7720_getTriggerLevel(s, channel, 417, &h.upper), 0);
        return h;
    }

    std::string group() const { return std::to_string(global::group_inputs); }
};

TEST_F(InputFrmTest, FirstOpeningReadsChannelOneAndShowsAll) {
    InputFrm& p = page();
    EXPECT_EQ(p.cur_chan, 1);
    EXPECT_EQ(text(p.inpmodeCmbo), "Combo1");
    open_page();
    EXPECT_EQ(p.windowTitle().toStdString(), "Input Setup");
    EXPECT_TRUE(p.isVisible());
    EXPECT_FALSE(main().isVisible());

    // Channel 1 at power-on: 2 V, DC, filter on, trigger off, Pos/Exit at 5 % / 10 %, Level, VOLT.
    EXPECT_EQ(calls("ost7720_get"),
              (Texts{"getCoupling(1)", "getAntiAliasDigital(1)", "getRange(1)", "getTriggerChannel(1)",
                     "getTriggerLevel(1, 416)", "getTriggerLevel(1, 417)", "getTriggerSlope(1)",
                     "getTriggerMode(1)", "getInputMode(1)"}));
    EXPECT_TRUE(sent().empty());
    EXPECT_TRUE(p.AllSameChk->isChecked());
    EXPECT_EQ(p.AllSameChk->text().toStdString(), "All Channels Identical");
    EXPECT_EQ(text(p.ChnNumCmbo), "ALL");
    EXPECT_FALSE(p.ChnNumCmbo->isEnabled());
    ASSERT_EQ(p.ChnNumCmbo->count(), 16);
    EXPECT_EQ(p.ChnNumCmbo->itemText(0).toStdString(), "1");
    EXPECT_EQ(p.ChnNumCmbo->itemText(15).toStdString(), "16");
    EXPECT_EQ(text(p.RangeTxt), "2");
    EXPECT_EQ(text(p.CoupCmbo), "DC Coupling");
    EXPECT_EQ(text(p.DAACmbo), "ON");
    EXPECT_EQ(text(p.TrigOnCmbo), "OFF");
    EXPECT_EQ(text(p.TrigDirCmbo), "Pos/Exit");
    EXPECT_EQ(text(p.TrigLvlTxt), " 10");
    EXPECT_EQ(text(p.HystTxt), " 5");
    EXPECT_EQ(text(p.TrigModeCmbo), "Level");
    EXPECT_EQ(text(p.inpmodeCmbo), "VOLT");
    EXPECT_EQ(text(p.GndCmbo), "On Breakout Box");
    EXPECT_EQ(text(p.AAACmbo), "Not Adjustable");
    EXPECT_FALSE(p.GndCmbo->isEnabled());
    EXPECT_FALSE(p.AAACmbo->isEnabled());
    EXPECT_EQ(p.DAALbl->text().toStdString(), "Digital  Anti Alias");
    EXPECT_EQ(p.AAALbl->text().toStdString(), "Analog  Anti Alias");
    EXPECT_TRUE(messages.empty());
}

TEST_F(InputFrmTest, OkSendsEveryCallToTheGroupOfInputs) {
    InputFrm& p = open_page();
    sim::clear_call_log();
    click(p.doneBtn);
    const std::string g = group();
    EXPECT_EQ(sent(), (Texts{"setRange(" + g + ", 2)", "setCoupling(" + g + ", 101)",
                             "setAntiAliasDigital(" + g + ", 615)", "setTriggerSlope(" + g + ", 410)",
                             "setTriggerChannel(" + g + ", 421)", "setInputMode(" + g + ", 130)",
                             "setTriggerMode(" + g + ", 414)", "setTriggerLevel(" + g + ", 416, 5)",
                             "setTriggerLevel(" + g + ", 417, 10)"}));
    EXPECT_TRUE(messages.empty());
    EXPECT_FALSE(p.isVisible());
    EXPECT_TRUE(main().isVisible());
    EXPECT_TRUE(main().isEnabled());
}

TEST_F(InputFrmTest, NewSettingsReachEveryInputAndShowOnReopening) {
    InputFrm& p = open_page();
    type(p.RangeTxt, "0.5");
    type(p.CoupCmbo, "AC Coupling");
    type(p.DAACmbo, "Off");
    type(p.TrigOnCmbo, "ON");
    type(p.TrigModeCmbo, "Bound");
    type(p.TrigDirCmbo, "Neg/Enter");
    type(p.TrigLvlTxt, "-20");
    type(p.HystTxt, "15");
    type(p.inpmodeCmbo, "ICP");
    click(p.doneBtn);
    EXPECT_TRUE(messages.empty());

    for (int32_t channel : {1, 9, 16}) {
        SCOPED_TRACE(channel);
        const Held h = held(channel);
        EXPECT_EQ(h.range, 0.5);
        EXPECT_EQ(h.coupling, 100);
        EXPECT_EQ(h.filter, 616);
        EXPECT_EQ(h.trigger, 420);
        EXPECT_EQ(h.trigger_mode, 415);
        EXPECT_EQ(h.slope, 411);
        EXPECT_EQ(h.input_mode, 131);
        EXPECT_EQ(h.lower, -20.0);
        EXPECT_EQ(h.upper, -5.0);
    }

    open_page();
    EXPECT_EQ(text(p.RangeTxt), ".5");
    EXPECT_EQ(text(p.CoupCmbo), "AC Coupling");
    EXPECT_EQ(text(p.DAACmbo), "OFF");
    EXPECT_EQ(text(p.TrigOnCmbo), "ON");
    EXPECT_EQ(text(p.TrigModeCmbo), "Bound");
    EXPECT_EQ(text(p.TrigDirCmbo), "Neg/Enter");
    EXPECT_EQ(text(p.TrigLvlTxt), "-20");  // a negative slope fires at the lower level
    EXPECT_EQ(text(p.HystTxt), " 15");
    EXPECT_EQ(text(p.inpmodeCmbo), "ICP");
}

TEST_F(InputFrmTest, OneChannelAtATimeWhenTheBoxIsCleared) {
    InputFrm& p = open_page();
    // Channel 1 differs from the others, so the reload shows where it read.
    ASSERT_EQ(ost7720_setRange(global::session, 1, 5), 0);
    sim::clear_call_log();

    click(p.AllSameChk);
    EXPECT_EQ(global::all_channels_match, global::flag_false);
    EXPECT_FALSE(p.AllSameChk->isChecked());
    EXPECT_EQ(text(p.ChnNumCmbo), "1");
    EXPECT_TRUE(p.ChnNumCmbo->isEnabled());
    EXPECT_EQ(text(p.RangeTxt), "5");
    EXPECT_EQ(calls("ost7720_get"),
              (Texts{"getCoupling(1)", "getAntiAliasDigital(1)", "getRange(1)", "getTriggerChannel(1)",
                     "getTriggerLevel(1, 416)", "getTriggerLevel(1, 417)", "getTriggerSlope(1)",
                     "getTriggerMode(1)", "getInputMode(1)"}));

    // Another number in the box reads nothing: OK writes the page's values to that channel.
    sim::clear_call_log();
    type(p.ChnNumCmbo, "3");
    EXPECT_TRUE(sim::call_log().empty());
    type(p.RangeTxt, "10");
    type(p.inpmodeCmbo, "MIC");
    click(p.doneBtn);
    EXPECT_EQ(p.cur_chan, 3);
    EXPECT_EQ(sent(),
              (Texts{"setRange(3, 10)", "setCoupling(3, 101)", "setAntiAliasDigital(3, 615)",
                     "setTriggerSlope(3, 410)", "setTriggerChannel(3, 421)", "setInputMode(3, 133)",
                     "setTriggerMode(3, 414)", "setTriggerLevel(3, 416, 5)", "setTriggerLevel(3, 417, 10)"}));
    EXPECT_EQ(held(3).range, 10.0);
    EXPECT_EQ(held(3).input_mode, 133);
    EXPECT_EQ(held(1).range, 5.0);
    EXPECT_EQ(held(4).range, 2.0);

    // Reopening shows the channel last confirmed, read from the module.
    sim::clear_call_log();
    open_page();
    EXPECT_EQ(text(p.ChnNumCmbo), "3");
    EXPECT_EQ(text(p.RangeTxt), "10");
    EXPECT_EQ(text(p.inpmodeCmbo), "MIC");
    EXPECT_EQ(calls("ost7720_get").front(), "getCoupling(3)");
    EXPECT_EQ(calls("ost7720_get").back(), "getInputMode(3)");

    // Checking the box again goes back to all inputs, read from channel 1.
    click(p.AllSameChk);
    EXPECT_EQ(global::all_channels_match, global::flag_true);
    EXPECT_EQ(text(p.ChnNumCmbo), "ALL");
    EXPECT_FALSE(p.ChnNumCmbo->isEnabled());
    EXPECT_EQ(text(p.RangeTxt), "5");
    EXPECT_EQ(p.cur_chan, 3);
}

TEST_F(InputFrmTest, RangeIsLimitedToZeroToTwentyBeforeItIsSent) {
    struct Case {
        const char* typed;
        const char* sent;
    };
    // The module takes at most 10 V: 20 goes out and is refused, the others are coerced.
    for (const Case& c : {Case{"25", "20"}, Case{"-3", "0"}, Case{" 7.5 V", "7.5"}, Case{"volts", "0"}}) {
        SCOPED_TRACE(c.typed);
        messages.clear();
        InputFrm& p = open_page();
        type(p.RangeTxt, c.typed);
        sim::clear_call_log();
        click(p.doneBtn);
        EXPECT_EQ(sent().front(), "setRange(" + group() + ", " + c.sent + ")");
    }
    EXPECT_EQ(held(1).range, 0.1);  // "volts" reads as 0, the smallest range
    open_page();
    messages.clear();
    type(page().RangeTxt, "25");
    click(page().doneBtn);
    ASSERT_EQ(messages.size(), 1u);
    EXPECT_NE(messages[0].text.find("ost7720_setRange returned -"), std::string::npos);
    EXPECT_EQ(held(1).range, 0.1);
}

TEST_F(InputFrmTest, LevelAndHysteresisFollowTheSlope) {
    struct Case {
        const char* slope;
        const char* level;
        const char* hysteresis;
        const char* lower_sent;
        const char* upper_sent;
        double lower;
        double upper;
    };
    for (const Case& c :
         {Case{"Pos/Exit", "50", "10", "40", "50", 40, 50}, Case{"Neg/Enter", "50", "10", "50", "60", 50, 60},
          Case{"Pos/Exit", "-12.5", ".5", "-13", "-12.5", -13, -12.5},
          Case{"pos/exit", "1", "2", "1", "3", 1, 3}}) {
        SCOPED_TRACE(std::string(c.slope) + " " + c.level + " " + c.hysteresis);
        InputFrm& p = open_page();
        type(p.TrigDirCmbo, c.slope);
        type(p.TrigLvlTxt, c.level);
        type(p.HystTxt, c.hysteresis);
        sim::clear_call_log();
        click(p.doneBtn);
        const Texts s = sent();
        ASSERT_EQ(s.size(), 9u);
        EXPECT_EQ(s[7], "setTriggerLevel(" + group() + ", 416, " + c.lower_sent + ")");
        EXPECT_EQ(s[8], "setTriggerLevel(" + group() + ", 417, " + c.upper_sent + ")");
        EXPECT_EQ(held(16).lower, c.lower);
        EXPECT_EQ(held(16).upper, c.upper);
    }
    EXPECT_TRUE(messages.empty());
}

TEST_F(InputFrmTest, ComparisonsAreExactExceptTheFilterAndTrailingBlanksOfTheMode) {
    struct Case {
        QComboBox* InputFrm::*box;
        const char* typed;
        size_t call;  // position among the set calls
        const char* code;
    };
    const Case cases[] = {
        {&InputFrm::DAACmbo, "On", 2, "615"},           {&InputFrm::DAACmbo, "ON", 2, "615"},
        {&InputFrm::DAACmbo, "on", 2, "615"},           {&InputFrm::DAACmbo, "Off", 2, "616"},
        {&InputFrm::DAACmbo, "OFF", 2, "616"},          {&InputFrm::DAACmbo, "ON ", 2, "616"},
        {&InputFrm::CoupCmbo, "AC Coupling", 1, "100"}, {&InputFrm::CoupCmbo, "ac coupling", 1, "101"},
        {&InputFrm::TrigDirCmbo, "Pos/Exit", 3, "410"}, {&InputFrm::TrigDirCmbo, "Pos/Exit ", 3, "411"},
        {&InputFrm::TrigOnCmbo, "OFF", 4, "421"},       {&InputFrm::TrigOnCmbo, "off", 4, "420"},
        {&InputFrm::TrigOnCmbo, "ON", 4, "420"},        {&InputFrm::TrigModeCmbo, "Level", 6, "414"},
        {&InputFrm::TrigModeCmbo, "level", 6, "415"},   {&InputFrm::inpmodeCmbo, "VOLT", 5, "130"},
        {&InputFrm::inpmodeCmbo, "ICP", 5, "131"},      {&InputFrm::inpmodeCmbo, "CHARGE", 5, "132"},
        {&InputFrm::inpmodeCmbo, "MIC", 5, "133"},      {&InputFrm::inpmodeCmbo, "MIC   ", 5, "133"},
        {&InputFrm::inpmodeCmbo, "MIC_200V", 5, "134"},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(std::string("\"") + c.typed + "\"");
        const Texts s = ok_with(page().*c.box, c.typed);
        ASSERT_EQ(s.size(), 9u);
        const std::string head = s[c.call].substr(0, s[c.call].find('('));
        EXPECT_EQ(s[c.call], head + "(" + group() + ", " + c.code + ")");
    }
    EXPECT_TRUE(messages.empty());
}

TEST_F(InputFrmTest, ModeWithoutANameIsNotSentAndTheRestIs) {
    ASSERT_EQ(ost7720_setInputMode(global::session, global::group_inputs, 132), 0);
    for (const char* typed : {"volt", " MIC", "MICRO", "XYZ", ""}) {
        SCOPED_TRACE(std::string("\"") + typed + "\"");
        const Texts s = ok_with(page().inpmodeCmbo, typed);
        const std::string g = group();
        EXPECT_EQ(s, (Texts{"setRange(" + g + ", 2)", "setCoupling(" + g + ", 101)",
                            "setAntiAliasDigital(" + g + ", 615)", "setTriggerSlope(" + g + ", 410)",
                            "setTriggerChannel(" + g + ", 421)", "setTriggerMode(" + g + ", 414)",
                            "setTriggerLevel(" + g + ", 416, 5)", "setTriggerLevel(" + g + ", 417, 10)"}));
        EXPECT_EQ(held(1).input_mode, 132);
        EXPECT_TRUE(main().isVisible());
    }
    // Each reopening read the module's mode back.
    open_page();
    EXPECT_EQ(text(page().inpmodeCmbo), "CHARGE");
    EXPECT_TRUE(messages.empty());
}

TEST_F(InputFrmTest, CancelSendsNothingAndReopeningShowsTheModule) {
    InputFrm& p = open_page();
    type(p.RangeTxt, "5");
    type(p.TrigLvlTxt, "70");
    type(p.inpmodeCmbo, "MIC");
    click(p.AllSameChk);
    type(p.ChnNumCmbo, "7");
    sim::clear_call_log();
    click(p.cancelBtn);
    EXPECT_TRUE(sim::call_log().empty());
    EXPECT_EQ(p.cur_chan, 1);
    EXPECT_FALSE(p.isVisible());
    EXPECT_TRUE(main().isVisible());

    open_page();
    EXPECT_EQ(text(p.ChnNumCmbo), "1");
    EXPECT_EQ(text(p.RangeTxt), "2");
    EXPECT_EQ(text(p.TrigLvlTxt), " 10");
    EXPECT_EQ(text(p.inpmodeCmbo), "VOLT");
    EXPECT_TRUE(messages.empty());
}

TEST_F(InputFrmTest, ChannelTheSessionLacksGoesToTheDriverAndEachRefusalIsReported) {
    InputFrm& p = open_page();
    click(p.AllSameChk);
    for (const char* typed : {"99", "0", "-3", "-32768.5"}) {
        SCOPED_TRACE(typed);
        const std::string target = typed == std::string("-32768.5") ? "-32768" : typed;  // half to even
        // After the first pass the page reads a channel the session lacks: its reads are refused.
        open_page();
        type(p.ChnNumCmbo, typed);
        type(p.RangeTxt, "2");
        type(p.TrigLvlTxt, "10");
        type(p.HystTxt, "5");
        type(p.TrigDirCmbo, "Pos/Exit");
        messages.clear();
        sim::clear_call_log();
        click(p.doneBtn);
        const Texts s = sent();
        ASSERT_EQ(s.size(), 9u);
        EXPECT_EQ(s[0], "setRange(" + target + ", 2)");
        EXPECT_EQ(s[8], "setTriggerLevel(" + target + ", 417, 10)");
        const Texts names = {"setRange",        "setCoupling",       "setAntiAliasDigital",
                             "setTriggerSlope", "setTriggerChannel", "setInputMode",
                             "setTriggerMode",  "setTriggerLevel",   "setTriggerLevel"};
        ASSERT_EQ(messages.size(), 9u);
        for (size_t i = 0; i < 9; ++i) {
            EXPECT_EQ(messages[i].kind, dialogs::Kind::question);
            EXPECT_NE(messages[i].text.find("ost7720_" + names[i] + " returned -"), std::string::npos)
                << messages[i].text;
        }
        EXPECT_EQ(std::to_string(p.cur_chan), target);
        EXPECT_TRUE(main().isVisible());
    }
    // Reopening reads the confirmed channel: each of the nine reads is refused and reported.
    messages.clear();
    open_page();
    EXPECT_EQ(text(p.ChnNumCmbo), "-32768");
    EXPECT_EQ(messages.size(), 9u);
    EXPECT_TRUE(p.isVisible());
}

TEST_F(InputFrmTest, ChannelBeyondSixteenBitsIsRefusedWithoutACall) {
    InputFrm& p = open_page();
    click(p.AllSameChk);
    for (const char* typed : {"40000", "1e10", "-40000", " 32767.5"}) {
        SCOPED_TRACE(typed);
        messages.clear();
        type(p.ChnNumCmbo, typed);
        sim::clear_call_log();
        click(p.doneBtn);
        EXPECT_TRUE(sim::call_log().empty());
        ASSERT_EQ(messages.size(), 1u);
        EXPECT_EQ(messages[0].kind, dialogs::Kind::notice);
        EXPECT_EQ(messages[0].text, "Channel number " + std::string(typed).substr(typed[0] == ' ') +
                                        " is not an input channel of this session.\r\n"
                                        "Choose a channel number from 1 to 16.");
        EXPECT_EQ(p.cur_chan, 1);
        EXPECT_TRUE(p.isVisible());
        EXPECT_FALSE(main().isVisible());
    }
    // The page stays as it was: a number that fits goes out.
    type(p.ChnNumCmbo, "2");
    messages.clear();
    click(p.doneBtn);
    EXPECT_EQ(p.cur_chan, 2);
    EXPECT_TRUE(messages.empty());
}

TEST_F(InputFrmTest, FailedReadIsReportedAndTheReloadGoesOn) {
    sim::fail("ost7720_getRange", -1105, 1);
    sim::fail("ost7720_getInputMode", -1103, 1);
    InputFrm& p = open_page();
    ASSERT_EQ(messages.size(), 2u);
    EXPECT_NE(messages[0].text.find("ost7720_getRange returned -1105"), std::string::npos);
    EXPECT_NE(messages[1].text.find("ost7720_getInputMode returned -1103"), std::string::npos);
    EXPECT_EQ(calls("ost7720_get").size(), 9u);
    EXPECT_EQ(text(p.RangeTxt), "0");
    EXPECT_EQ(text(p.TrigLvlTxt), " 10");
    EXPECT_EQ(text(p.TrigModeCmbo), "Level");
    EXPECT_EQ(text(p.inpmodeCmbo), "Combo1");  // no mode read: the designed text stays

    // A failed write is reported too, and OK still goes on and returns.
    messages.clear();
    sim::fail("ost7720_setCoupling", -1105, 1);
    sim::clear_call_log();
    click(p.doneBtn);
    EXPECT_EQ(sent().size(), 8u);  // "Combo1" names no mode
    ASSERT_EQ(messages.size(), 1u);
    EXPECT_NE(messages[0].text.find("ost7720_setCoupling returned -1105"), std::string::npos);
    EXPECT_TRUE(main().isVisible());
}

TEST_F(InputFrmTest, FieldsStandInTheGridAndStayReadable) {
    main().resize(900, 700);
    InputFrm& p = open_page();
    p.resize(900, 700);
    ASSERT_EQ(p.size(), QSize(900, 700));
    // Row unit 700 / 18 px, column unit 75 px; the second column starts five units further.
    EXPECT_EQ(p.AllSameChk->pos(), QPoint(112, 39));  // 112.5 and 38.9 rounded
    EXPECT_EQ(p.ChanNumLbl->pos(), QPoint(38, 117));
    EXPECT_EQ(p.ChnNumCmbo->pos(), QPoint(150, 117));
    EXPECT_EQ(p.AAACmbo->pos(), QPoint(150, 506));
    EXPECT_EQ(p.inpmodeLbl->pos(), QPoint(412, 39));
    EXPECT_EQ(p.inpmodeCmbo->pos(), QPoint(525, 39));
    EXPECT_EQ(p.TrigDirCmbo->pos(), QPoint(525, 428));
    EXPECT_EQ(p.DAALbl->height(), 20);
    EXPECT_EQ(page_check::layout_faults(&p), Texts{});
    // Every field shows its text whole, the disabled boxes' fixed texts included.
    for (QComboBox* box : {p.ChnNumCmbo, p.CoupCmbo, p.GndCmbo, p.DAACmbo, p.AAACmbo, p.inpmodeCmbo,
                           p.TrigOnCmbo, p.TrigModeCmbo, p.TrigDirCmbo}) {
        SCOPED_TRACE(text(box));
        EXPECT_GE(box->lineEdit()->width(), box->fontMetrics().horizontalAdvance(box->currentText()) + 4);
        EXPECT_LE(box->x() + box->width(),
                  box == p.inpmodeCmbo || box == p.TrigOnCmbo || box == p.TrigModeCmbo || box == p.TrigDirCmbo
                      ? 900
                      : 412);
    }

    // In a narrow window the fields of a column start after its widest label, all at one left.
    for (const QSize size : {QSize(533, 400), QSize(640, 480)}) {
        SCOPED_TRACE(size.width());
        p.resize(size);
        EXPECT_EQ(page_check::layout_faults(&p), Texts{});
        EXPECT_GT(p.ChnNumCmbo->x(), p.AAALbl->x() + p.AAALbl->width());
        EXPECT_GT(p.inpmodeCmbo->x(), p.HystLbl->x() + p.HystLbl->width());
        for (QWidget* field :
             std::initializer_list<QWidget*>{p.RangeTxt, p.CoupCmbo, p.GndCmbo, p.DAACmbo, p.AAACmbo})
            EXPECT_EQ(field->x(), p.ChnNumCmbo->x());
        for (QWidget* field : std::initializer_list<QWidget*>{p.TrigOnCmbo, p.TrigModeCmbo, p.TrigLvlTxt,
                                                              p.HystTxt, p.TrigDirCmbo})
            EXPECT_EQ(field->x(), p.inpmodeCmbo->x());
        EXPECT_LT(p.ChnNumCmbo->x() + p.ChnNumCmbo->width(), p.inpmodeLbl->x());
    }
}

}  // namespace
