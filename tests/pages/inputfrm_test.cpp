// The Input Setup page: what it reads when shown, what OK sends to one channel or to all inputs,
// and the refusals, checked against the simulator's call log and the settings it keeps.
#include <gtest/gtest.h>

#include <array>

#include "ost7720.h"
#include "page_fixture.h"
#include "pages/InputFrm.h"

namespace {

// What OK sends for the page as first shown: 2 V, DC, filter on, Pos/Exit, trigger off, VOLT,
// Level, lower and upper level 5 % and 10 %.
const Texts sent_first = {"2", "101", "615", "410", "421", "130", "414", "416, 5", "417, 10"};
const Texts shown_first = {"ALL", "2", "DC Coupling", "ON", "OFF", "Level", "Pos/Exit", " 10", " 5", "VOLT"};

class InputFrmTest : public PageTest {
  protected:
    InputFrm& open() {
        main().InpBtn_Click();
        return forms::get<InputFrm>();
    }
    std::string group() const { return std::to_string(global::group_inputs); }

    // The nine set calls of OK, in order, to target with these values; an empty value: no call.
    static Texts nine(const std::string& target, const Texts& values) {
        static const char* const names[] = {"setRange",        "setCoupling",       "setAntiAliasDigital",
                                            "setTriggerSlope", "setTriggerChannel", "setInputMode",
                                            "setTriggerMode",  "setTriggerLevel",   "setTriggerLevel"};
        Texts out;
        for (size_t i = 0; i < 9; ++i)
            if (!values[i].empty())
                out.push_back(names[i] + ("(" + target + ", ") + values[i] + ")");
        return out;
    }

    // The set calls of OK after typing into one box of the page.
    Texts ok_with(QLineEdit* box, const char* typed) {
        InputFrm& p = open();
        type(box, typed);
        sim::clear_call_log();
        click(p.doneBtn);
        return calls({"set"});
    }

    // What a channel holds, in the order of the nine set calls.
    static std::vector<double> held(int32_t ch) {
        const int32_t s = global::session;
        double range = 0, lower = 0, upper = 0;
        int32_t coupling = 0, filter = 0, slope = 0, trigger = 0, mode = 0, trigger_mode = 0;
        EXPECT_EQ(ost7720_getRange(s, ch, &range) | ost7720_getCoupling(s, ch, &coupling) |
                      ost7720_getAntiAliasDigital(s, ch, &filter) | ost7720_getTriggerSlope(s, ch, &slope) |
                      ost7720_getTriggerChannel(s, ch, &trigger) | ost7720_getInputMode(s, ch, &mode) |
                      ost7720_getTriggerMode(s, ch, &trigger_mode) |
                      ost7720_getTriggerLevel(s, ch, 416, &lower) |
                      ost7720_getTriggerLevel(s, ch, 417, &upper),
                  0);
        return {range,        double(coupling),     double(filter), double(slope), double(trigger),
                double(mode), double(trigger_mode), lower,          upper};
    }

    static Texts fields(const InputFrm& p) {
        return {text(p.ChnNumCmbo), text(p.RangeTxt),     text(p.CoupCmbo),    text(p.DAACmbo),
                text(p.TrigOnCmbo), text(p.TrigModeCmbo), text(p.TrigDirCmbo), text(p.TrigLvlTxt),
                text(p.HystTxt),    text(p.inpmodeCmbo)};
    }
};

TEST_F(InputFrmTest, FirstOpeningReadsChannelOneShowsAllCancelSendsNothingOkSendsToTheGroup) {
    InputFrm& p = open();
    EXPECT_FALSE(main().isVisible());
    EXPECT_EQ(calls({"get", "set"}),
              (Texts{"getCoupling(1)", "getAntiAliasDigital(1)", "getRange(1)", "getTriggerChannel(1)",
                     "getTriggerLevel(1, 416)", "getTriggerLevel(1, 417)", "getTriggerSlope(1)",
                     "getTriggerMode(1)", "getInputMode(1)"}));
    EXPECT_TRUE(p.AllSameChk->isChecked());
    EXPECT_EQ(p.AllSameChk->text().toStdString(), "All Channels Identical");
    EXPECT_FALSE(p.ChnNumCmbo->isEnabled());
    EXPECT_EQ(items(p.ChnNumCmbo).size(), 16u);
    EXPECT_EQ(fields(p), shown_first);
    // The two boxes the page never reads keep their fixed texts, disabled.
    EXPECT_EQ(text(p.GndCmbo), "On Breakout Box");
    EXPECT_EQ(text(p.AAACmbo), "Not Adjustable");
    EXPECT_FALSE(p.GndCmbo->isEnabled() || p.AAACmbo->isEnabled());
    EXPECT_EQ(text(p.DAALbl), "Digital  Anti Alias");
    EXPECT_EQ(text(p.AAALbl), "Analog  Anti Alias");

    type(p.RangeTxt, "5");
    type(p.inpmodeCmbo, "MIC");
    sim::clear_call_log();
    click(p.cancelBtn);
    EXPECT_TRUE(main().isVisible());
    EXPECT_TRUE(sim::call_log().empty());
    EXPECT_EQ(fields(open()), shown_first);

    sim::clear_call_log();
    click(p.doneBtn);
    EXPECT_EQ(calls({"set"}), nine(group(), sent_first));
    EXPECT_TRUE(main().isVisible());
    EXPECT_TRUE(messages.empty());
}

TEST_F(InputFrmTest, NewSettingsReachEveryInputAndShowOnReopening) {
    InputFrm& p = open();
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
    for (int32_t channel : {1, 16})
        EXPECT_EQ(held(channel), (std::vector<double>{0.5, 100, 616, 411, 420, 131, 415, -20, -5}))
            << channel;
    // A negative slope fires at the lower level.
    EXPECT_EQ(fields(open()),
              (Texts{"ALL", ".5", "AC Coupling", "OFF", "ON", "Bound", "Neg/Enter", "-20", " 15", "ICP"}));
}

TEST_F(InputFrmTest, OneChannelAtATimeWhenTheBoxIsCleared) {
    InputFrm& p = open();
    sim::clear_call_log();
    click(p.AllSameChk);
    EXPECT_EQ(global::all_channels_match, global::flag_false);
    EXPECT_TRUE(p.ChnNumCmbo->isEnabled());
    EXPECT_EQ(text(p.ChnNumCmbo), "1");
    EXPECT_EQ(calls({"get"}).size(), 9u);

    // Another number reads nothing: OK writes the page's values to that channel.
    sim::clear_call_log();
    type(p.ChnNumCmbo, "3");
    EXPECT_TRUE(sim::call_log().empty());
    type(p.inpmodeCmbo, "MIC");
    click(p.doneBtn);
    Texts values = sent_first;
    values[5] = "133";
    EXPECT_EQ(calls({"set"}), nine("3", values));
    EXPECT_EQ(held(4)[5], 130);

    // Reopening reads the channel last confirmed: mode 133 shows as "MIC".
    sim::clear_call_log();
    open();
    EXPECT_EQ(text(p.ChnNumCmbo), "3");
    EXPECT_EQ(text(p.inpmodeCmbo), "MIC");
    EXPECT_EQ(calls({"get"}).front(), "getCoupling(3)");
    // Checked again: all inputs, read from channel 1.
    click(p.AllSameChk);
    EXPECT_EQ(fields(p), shown_first);
}

TEST_F(InputFrmTest, TypedTextsBecomeCodesAndLimitedRanges) {
    InputFrm& p = forms::get<InputFrm>();
    struct Case {
        QLineEdit* box;
        const char* typed;
        size_t call;  // among the nine set calls
        const char* sent;
    };
    // Exact, case-sensitive comparisons, except the filter ("ON" in any case) and the trailing
    // blanks of the input mode; the range is kept within 0 to 20.
    const Case cases[] = {
        {p.DAACmbo->lineEdit(), "On", 2, "615"},
        {p.DAACmbo->lineEdit(), "ON", 2, "615"},
        {p.DAACmbo->lineEdit(), "on", 2, "615"},
        {p.DAACmbo->lineEdit(), "Off", 2, "616"},
        {p.DAACmbo->lineEdit(), "ON ", 2, "616"},
        {p.CoupCmbo->lineEdit(), "AC Coupling", 1, "100"},
        {p.CoupCmbo->lineEdit(), "ac coupling", 1, "101"},
        {p.TrigDirCmbo->lineEdit(), "Pos/Exit ", 3, "411"},
        {p.TrigOnCmbo->lineEdit(), "OFF", 4, "421"},
        {p.TrigOnCmbo->lineEdit(), "off", 4, "420"},
        {p.TrigModeCmbo->lineEdit(), "Level", 6, "414"},
        {p.TrigModeCmbo->lineEdit(), "level", 6, "415"},
        {p.inpmodeCmbo->lineEdit(), "ICP", 5, "131"},
        {p.inpmodeCmbo->lineEdit(), "CHARGE", 5, "132"},
        {p.inpmodeCmbo->lineEdit(), "MIC   ", 5, "133"},
        {p.inpmodeCmbo->lineEdit(), "MIC_200V", 5, "134"},
        {p.RangeTxt, "25", 0, "20"},
        {p.RangeTxt, "-3", 0, "0"},
        {p.RangeTxt, " 7.5 V", 0, "7.5"},
        {p.RangeTxt, "volts", 0, "0"},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(std::string("\"") + c.typed + "\"");
        // Earlier cases changed the other settings: look at this one only.
        const Texts sent = ok_with(c.box, c.typed);
        ASSERT_EQ(sent.size(), 9u);
        Texts values = sent_first;
        values[c.call] = c.sent;
        EXPECT_EQ(sent[c.call], nine(group(), values)[c.call]);
    }
    // The module takes at most 10 V: 20 is refused, and said so.
    ASSERT_EQ(messages.size(), 1u);
    EXPECT_NE(messages[0].text.find("ost7720_setRange returned -"), std::string::npos);
}

TEST_F(InputFrmTest, LevelAndHysteresisFollowTheSlope) {
    // slope, level, hysteresis typed; lower and upper level sent
    for (const auto& [slope, level, hysteresis, lower, upper] :
         {std::array{"Pos/Exit", "50", "10", "40", "50"}, std::array{"Neg/Enter", "50", "10", "50", "60"},
          std::array{"Pos/Exit", "-12.5", ".5", "-13", "-12.5"},
          std::array{"pos/exit", "1", "2", "1", "3"}}) {
        SCOPED_TRACE(std::string(slope) + " " + level + " " + hysteresis);
        InputFrm& p = open();
        type(p.TrigDirCmbo, slope);
        type(p.TrigLvlTxt, level);
        type(p.HystTxt, hysteresis);
        sim::clear_call_log();
        click(p.doneBtn);
        EXPECT_EQ(calls({"setTriggerLevel"}),
                  (Texts{"setTriggerLevel(" + group() + ", 416, " + lower + ")",
                         "setTriggerLevel(" + group() + ", 417, " + upper + ")"}));
    }
    EXPECT_TRUE(messages.empty());
}

TEST_F(InputFrmTest, ModeWithoutANameIsNotSentAndTheChannelKeepsItsMode) {
    ASSERT_EQ(ost7720_setInputMode(global::session, global::group_inputs, 132), 0);
    Texts values = sent_first;
    values[5] = "";
    for (const char* typed : {"volt", " MIC", "MICRO", ""}) {
        SCOPED_TRACE(std::string("\"") + typed + "\"");
        EXPECT_EQ(ok_with(forms::get<InputFrm>().inpmodeCmbo->lineEdit(), typed), nine(group(), values));
        EXPECT_TRUE(main().isVisible());
    }
    EXPECT_EQ(text(open().inpmodeCmbo), "CHARGE");
    EXPECT_TRUE(messages.empty());
}

TEST_F(InputFrmTest, ChannelTheSessionLacksGoesToTheDriverAndEachRefusalIsReported) {
    click(open().AllSameChk);
    for (const char* typed : {"99", "0", "-32768.5"}) {
        SCOPED_TRACE(typed);
        const std::string target = typed == std::string("-32768.5") ? "-32768" : typed;  // half to even
        type(open().ChnNumCmbo, typed);
        messages.clear();
        sim::clear_call_log();
        click(forms::get<InputFrm>().doneBtn);
        const Texts sent = calls({"set"});
        ASSERT_EQ(sent.size(), 9u);
        ASSERT_EQ(messages.size(), 9u);
        for (size_t i = 0; i < 9; ++i) {
            const std::string name = sent[i].substr(0, sent[i].find('('));
            EXPECT_EQ(sent[i].substr(name.size(), target.size() + 2), "(" + target + ",");
            EXPECT_NE(messages[i].text.find("ost7720_" + name + " returned -"), std::string::npos);
        }
        EXPECT_TRUE(main().isVisible());
    }
    // Reopening reads the confirmed channel: each of the nine reads is refused and reported.
    messages.clear();
    EXPECT_EQ(text(open().ChnNumCmbo), "-32768");
    EXPECT_EQ(messages.size(), 9u);
}

TEST_F(InputFrmTest, ChannelBeyondSixteenBitsIsRefusedWithoutACall) {
    InputFrm& p = open();
    click(p.AllSameChk);
    for (const char* typed : {"40000", "65537", " 32767.5"}) {
        SCOPED_TRACE(typed);
        messages.clear();
        type(p.ChnNumCmbo, typed);
        sim::clear_call_log();
        click(p.doneBtn);
        EXPECT_TRUE(sim::call_log().empty());
        EXPECT_EQ(notices(), Texts{"Channel number " + std::string(typed).substr(typed[0] == ' ') +
                                   " is not an input channel of this session.\r\n"
                                   "Choose a channel number from 1 to 16."});
        EXPECT_EQ(p.cur_chan, 1);
        EXPECT_TRUE(p.isVisible());
    }
}

TEST_F(InputFrmTest, FieldsStandInTheGridAndStayReadable) {
    InputFrm& p = open();
    p.resize(900, 700);
    // Rows of 700 / 18 px, columns of 75 px; the second column starts five columns further.
    EXPECT_EQ(p.AllSameChk->pos(), QPoint(112, 39));
    EXPECT_EQ(p.AAACmbo->pos(), QPoint(150, 506));
    EXPECT_EQ(p.TrigDirCmbo->pos(), QPoint(525, 428));
    for (QComboBox* box : {p.GndCmbo, p.AAACmbo, p.CoupCmbo, p.TrigDirCmbo})
        EXPECT_GE(box->lineEdit()->width(), box->fontMetrics().horizontalAdvance(box->currentText()) + 4)
            << text(box);
    // In a narrow window the fields of a column start after its widest label.
    for (const QSize size : {QSize(900, 700), QSize(533, 400)}) {
        SCOPED_TRACE(size.width());
        p.resize(size);
        EXPECT_EQ(page_check::layout_faults(&p), Texts{});
        EXPECT_GT(p.ChnNumCmbo->x(), p.AAALbl->x() + p.AAALbl->width());
        EXPECT_GT(p.inpmodeCmbo->x(), p.HystLbl->x() + p.HystLbl->width());
        EXPECT_EQ(p.RangeTxt->x(), p.ChnNumCmbo->x());
        EXPECT_EQ(p.HystTxt->x(), p.inpmodeCmbo->x());
    }
}

}  // namespace

namespace {

// After OK, the module measures with what the page sent: the looped-back 1 V sine is clipped by a
// lower range, and an input set to trigger starts the block on its level crossing.
TEST_F(InputFrmTest, SettingsSentByOkShapeTheNextBlock) {
    sim::use_virtual_clock();
    auto one_block = [] {
        main().GoBtn_Click();
        // A block takes 1024 / 51200 s once triggered; the 1 kHz sine crosses within 1 ms.
        for (int tick = 0; tick < 10 && global::running == global::flag_true; ++tick) {
            sim::advance_clock(0.005);
            main().MainTimer_Timer();
        }
        EXPECT_EQ(global::running, global::flag_false);
        EXPECT_EQ(global::trace_has_data[0], global::flag_true);
        return std::vector<double>(global::trace1_data.begin(), global::trace1_data.begin() + 1024);
    };

    InputFrm& p = open();
    type(p.RangeTxt, "0.5");
    click(p.doneBtn);
    const std::vector<double> clipped = one_block();
    EXPECT_DOUBLE_EQ(*std::max_element(clipped.begin(), clipped.end()), 0.5);
    EXPECT_DOUBLE_EQ(*std::min_element(clipped.begin(), clipped.end()), -0.5);
    EXPECT_EQ(global::trace_range[0], 0.5);

    global::trigger_source = 2;  // "Input" on the Meas page
    open();
    type(p.RangeTxt, "2");
    type(p.TrigOnCmbo, "ON");
    type(p.TrigDirCmbo, "Pos/Exit");
    type(p.TrigLvlTxt, "25");  // 25 % of 2 V: the sine rises through 0.5 V
    type(p.HystTxt, "10");
    click(p.doneBtn);
    const std::vector<double> triggered = one_block();
    // 1 kHz sampled at 51200 Hz rises at most 0.123 V per sample.
    EXPECT_GE(triggered[0], 0.5 - 0.01);
    EXPECT_LT(triggered[0], 0.5 + 0.13);
    EXPECT_GT(triggered[1], triggered[0]);
    EXPECT_TRUE(notices().empty());
}

}  // namespace
