// The Source Setup page: choosing the source, what a load shows (with the hints), Default
// Values, OK, Apply and Cancel, and the layout, against the simulator's settings and call log.
#include <gtest/gtest.h>

#include <QFocusEvent>
#include <QSignalBlocker>
#include <QTest>
#include <string>
#include <vector>

#include "core/global.h"
#include "core/windows.h"
#include "display/MainFrm.h"
#include "ost7720.h"
#include "page_readability.h"
#include "pages/SrcFrm.h"
#include "panel_fixture.h"

namespace {

constexpr int32_t src1 = 4097;
constexpr int32_t src2 = 4098;
constexpr int32_t src3 = 4099;

class SrcFrmTest : public PanelTest {
  protected:
    // Three modules with one source each. The source at the lowest address powers on active;
    // start-up lists the modules from the highest address, so that is source 3.
    void SetUp() override {
        PanelTest::SetUp();
        start({{8, 8, 1, 2, 8}, {16, 8, 1, 0, 32}, {24, 8, 1, 0, 8}});
    }

    void start(const std::vector<sim::ModuleSpec>& system) {
        forms::destroy_all();
        use_system(system);
        main().Form_Load();
        main().resize(900, 700);
    }

    MainFrm& main() { return forms::get<MainFrm>(); }

    // As the main window's Source button does.
    SrcFrm& open_page() {
        SrcFrm& page = forms::get<SrcFrm>();
        switch_page(main(), page);
        return page;
    }

    // Typing over the whole text, one key at a time.
    static void type(QLineEdit* box, const char* text) {
        box->selectAll();
        QTest::keyClicks(box, QString::fromUtf8(text));
    }
    static void type(QComboBox* box, const char* text) { type(box->lineEdit(), text); }

    static void click(QAbstractButton* b) { QTest::mouseClick(b, Qt::LeftButton); }

    static std::string text(const QComboBox* box) { return box->currentText().toStdString(); }
    static std::string text(const QLineEdit* box) { return box->text().toStdString(); }

    // The channels that the page's getters read since the log was cleared.
    static std::vector<std::string> channels_read() {
        std::vector<std::string> out;
        for (const sim::Call& c : sim::call_log())
            if (c.name == "ost7720_getSourceMode")
                out.push_back(c.args.at(1));
        return out;
    }

    static int count(const std::string& name) {
        int n = 0;
        for (const sim::Call& c : sim::call_log())
            n += c.name == name ? 1 : 0;
        return n;
    }

    static void set(int32_t (*setter)(int32_t, int32_t, double), int32_t channel, double value) {
        ASSERT_EQ(setter(global::session, channel, value), 0);
    }
    static void set(int32_t (*setter)(int32_t, int32_t, int32_t), int32_t channel, int32_t value) {
        ASSERT_EQ(setter(global::session, channel, value), 0);
    }
};

TEST_F(SrcFrmTest, TheSourceNumberIsKeptWithinTheSessionsSources) {
    SrcFrm& page = open_page();
    EXPECT_EQ(page.windowTitle().toStdString(), "Source Setup");
    ASSERT_EQ(page.SrcWhoCmbo->count(), 3);
    EXPECT_EQ(page.SrcWhoCmbo->itemText(0).toStdString(), "1");
    EXPECT_EQ(page.SrcWhoCmbo->itemText(1).toStdString(), "2");
    EXPECT_EQ(page.SrcWhoCmbo->itemText(2).toStdString(), "3");
    EXPECT_EQ(page.cur_src, 1);
    EXPECT_EQ(text(page.SrcWhoCmbo), "1");

    sim::clear_call_log();
    type(page.SrcWhoCmbo, "7");
    EXPECT_EQ(text(page.SrcWhoCmbo), "3");
    EXPECT_EQ(page.cur_src, 3);
    EXPECT_EQ(channels_read(), std::vector<std::string>{"4099"});

    sim::clear_call_log();
    type(page.SrcWhoCmbo, "0");
    EXPECT_EQ(text(page.SrcWhoCmbo), "1");
    EXPECT_EQ(page.cur_src, 1);
    EXPECT_EQ(channels_read(), std::vector<std::string>{"4097"});

    // A pasted text with no number.
    type(page.SrcWhoCmbo, "2");
    sim::clear_call_log();
    page.SrcWhoCmbo->setEditText(QStringLiteral("abc"));
    EXPECT_EQ(text(page.SrcWhoCmbo), "1");
    EXPECT_EQ(channels_read(), std::vector<std::string>{"4097"});

    // The number already shown reloads nothing; nor does a number that comes out as it.
    sim::clear_call_log();
    type(page.SrcWhoCmbo, "1");
    page.SrcWhoCmbo->setEditText(QStringLiteral("1.5 volts"));  // 1.5 rounds to 2
    EXPECT_EQ(page.cur_src, 2);
    sim::clear_call_log();
    page.SrcWhoCmbo->setEditText(QStringLiteral("2.5"));  // the half goes to the even 2
    page.SrcWhoCmbo->setEditText(QStringLiteral(" 2"));
    EXPECT_TRUE(sim::call_log().empty());
    EXPECT_EQ(page.cur_src, 2);

    // Picking an item from the list.
    page.SrcWhoCmbo->setCurrentIndex(2);
    emit page.SrcWhoCmbo->activated(2);
    EXPECT_EQ(page.cur_src, 3);
    EXPECT_EQ(channels_read(), std::vector<std::string>{"4099"});
    EXPECT_TRUE(messages.empty());
}

TEST_F(SrcFrmTest, LeavingTheBoxShowsTheSourceHeld) {
    SrcFrm& page = open_page();
    type(page.SrcWhoCmbo, "3");
    // 7 comes out as the source already shown: nothing to load, the text stays while typing.
    sim::clear_call_log();
    type(page.SrcWhoCmbo, "7");
    EXPECT_EQ(text(page.SrcWhoCmbo), "7");
    QFocusEvent out(QEvent::FocusOut, Qt::TabFocusReason);
    QCoreApplication::sendEvent(page.SrcWhoCmbo->lineEdit(), &out);
    EXPECT_EQ(text(page.SrcWhoCmbo), "3");
    EXPECT_TRUE(sim::call_log().empty());

    // So OK writes the source shown instead of silently nothing.
    type(page.FreqTxt, "1234");
    type(page.SrcWhoCmbo, "9");
    QCoreApplication::sendEvent(page.SrcWhoCmbo->lineEdit(), &out);
    click(page.doneBtn);
    sim::SourceView view;
    ASSERT_TRUE(sim::read_source(global::session, src3, view));
    EXPECT_EQ(view.sine_freq, 1234.0);
}

TEST_F(SrcFrmTest, WithoutSourcesThePageShowsNoneAndCallsNothing) {
    start({{8, 8, 0, 2, 8}});
    ASSERT_EQ(global::num_sources, 0);
    SrcFrm& page = open_page();
    EXPECT_EQ(page.SrcWhoCmbo->count(), 0);
    EXPECT_EQ(text(page.SrcWhoCmbo), "NONE");
    EXPECT_EQ(page.cur_src, 0);
    EXPECT_EQ(text(page.FreqTxt), "");
    EXPECT_TRUE(page.NoteTxt->isHidden());

    sim::clear_call_log();
    click(page.PresetBtn);
    type(page.SrcWhoCmbo, "1");
    EXPECT_EQ(page.cur_src, 0);
    click(page.ApplyBtn);
    EXPECT_TRUE(sim::call_log().empty());
    EXPECT_EQ(text(page.SrcWhoCmbo), "NONE");
    EXPECT_TRUE(page.isVisible());
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
    SrcFrm& page = open_page();
    EXPECT_TRUE(page.NoteTxt->isVisible());
    EXPECT_FALSE(page.NoteTxt->isEnabled());
    EXPECT_EQ(page.NoteTxt->toPlainText().toStdString(),
              "No Source?  Try:\n"
              "Output -> Normal\n"
              "Active -> On\n"
              "RampRate -> 0\n"
              "Range -> higher\n"
              "Freq -> higher\n"
              "Duty Cycle -> 1");
    EXPECT_EQ(text(page.ActiveCmbo), "Off");
    EXPECT_EQ(text(page.OutputCmbo), "Grounded");
    EXPECT_EQ(text(page.RampRateTxt), "2.5");
    EXPECT_EQ(text(page.RangeTxt), ".5");
    EXPECT_EQ(text(page.FreqTxt), "50");
    EXPECT_EQ(text(page.DutyTxt), ".25");
    EXPECT_EQ(page_check::layout_faults(&page), std::vector<std::string>{});

    // One hint alone, and the strict tests at their boundaries.
    set(ost7720_setActive, src1, 420);
    set(ost7720_setSourceOutput, src1, 700);
    set(ost7720_setRampRate, src1, 0.0);
    set(ost7720_setRange, src1, 1.0);
    set(ost7720_setSineFreq, src1, 100.0);
    click(page.cancelBtn);
    open_page();
    EXPECT_EQ(page.NoteTxt->toPlainText().toStdString(), "No Source?  Try:\nDuty Cycle -> 1");
    set(ost7720_setDutyCycle, src1, 0.5);
    click(page.cancelBtn);
    open_page();
    EXPECT_TRUE(page.NoteTxt->isHidden());
    EXPECT_FALSE(page.NoteTxt->isEnabled());
    EXPECT_TRUE(messages.empty());
}

TEST_F(SrcFrmTest, LoadingShowsWhatTheSourceHolds) {
    set(ost7720_setTriggerChannel, src2, 420);
    set(ost7720_setSourceMode, src2, 175);
    set(ost7720_setSourceOutput, src2, 704);
    set(ost7720_setSourceCola, src2, 181);
    set(ost7720_setSourceSum, src2, 191);
    set(ost7720_setSinePhase, src2, -90.25);
    set(ost7720_setSourceSeed, src2, 200);
    set(ost7720_setRange, src2, 7.5);
    SrcFrm& page = open_page();
    EXPECT_EQ(text(page.SrcTrigCmbo), "Off");
    EXPECT_EQ(text(page.ModeCmbo), "Sine");
    EXPECT_EQ(text(page.ColaCmbo), "Off");
    EXPECT_EQ(text(page.SumCmbo), "Off");
    type(page.SrcWhoCmbo, "2");
    EXPECT_EQ(text(page.ActiveCmbo), "Off");
    EXPECT_EQ(text(page.SrcTrigCmbo), "On");
    EXPECT_EQ(text(page.ModeCmbo), "Burst Zoom Random");
    EXPECT_EQ(text(page.OutputCmbo), "Multi");
    EXPECT_EQ(text(page.ColaCmbo), "On");
    EXPECT_EQ(text(page.SumCmbo), "On");
    EXPECT_EQ(text(page.PhaseTxt), "-90.25");
    EXPECT_EQ(text(page.SeedTxt), "200");
    EXPECT_EQ(text(page.RangeTxt), "7.5");
    EXPECT_EQ(text(page.FreqTxt), "1000");
    EXPECT_EQ(text(page.RampRateTxt), "0");
    EXPECT_EQ(text(page.DutyTxt), "1");

    // A read that fails is reported under its name; the box keeps its text, loading goes on.
    page.FreqTxt->setText(QStringLiteral("kept"));
    page.DutyTxt->clear();
    sim::fail("ost7720_getSineFreq", -1074001, 1);
    type(page.SrcWhoCmbo, "3");
    ASSERT_EQ(messages.size(), 1u);
    EXPECT_EQ(messages[0].kind, dialogs::Kind::question);
    EXPECT_NE(messages[0].text.find("ost7720_getSineFreq returned -1074001"), std::string::npos);
    EXPECT_EQ(text(page.FreqTxt), "kept");
    EXPECT_EQ(text(page.DutyTxt), "1");
    EXPECT_EQ(text(page.SrcWhoCmbo), "3");
}

TEST_F(SrcFrmTest, DefaultValuesPresetsTheSourceShownAndReloads) {
    set(ost7720_setSineFreq, src2, 50.0);
    set(ost7720_setSourceMode, src2, 172);
    SrcFrm& page = open_page();
    type(page.SrcWhoCmbo, "2");
    EXPECT_EQ(text(page.FreqTxt), "50");
    type(page.FreqTxt, "9999");
    sim::clear_call_log();
    click(page.PresetBtn);
    ASSERT_FALSE(sim::call_log().empty());
    EXPECT_EQ(sim::call_log().front().name, "ost7720_preset");
    EXPECT_EQ(sim::call_log().front().args.at(1), "4098");
    EXPECT_EQ(count("ost7720_preset"), 1);
    EXPECT_EQ(channels_read(), std::vector<std::string>{"4098"});
    EXPECT_EQ(text(page.FreqTxt), "1000");
    EXPECT_EQ(text(page.ModeCmbo), "Sine");
    EXPECT_TRUE(page.isVisible());
    EXPECT_TRUE(messages.empty());
}

TEST_F(SrcFrmTest, OkWritesAndReturnsApplyStaysReloadedCancelWritesNothing) {
    SrcFrm& page = open_page();
    type(page.FreqTxt, "2000");
    type(page.PhaseTxt, "45");
    sim::clear_call_log();
    click(page.ApplyBtn);
    EXPECT_TRUE(page.isVisible());
    EXPECT_FALSE(main().isVisible());
    sim::SourceView view;
    ASSERT_TRUE(sim::read_source(global::session, src1, view));
    EXPECT_EQ(view.sine_freq, 2000.0);
    EXPECT_EQ(view.sine_phase, 45.0);
    // Written, read back, written again as read back, then laid out and read once more.
    EXPECT_EQ(count("ost7720_setSineFreq"), 2);
    EXPECT_EQ(count("ost7720_getSineFreq"), 2);
    EXPECT_EQ(text(page.FreqTxt), "2000");

    // An edit dropped by a resize, and by Cancel.
    type(page.FreqTxt, "3000");
    page.resize(880, 690);
    EXPECT_EQ(text(page.FreqTxt), "2000");
    type(page.FreqTxt, "3000");
    sim::clear_call_log();
    click(page.cancelBtn);
    EXPECT_TRUE(main().isVisible());
    EXPECT_FALSE(page.isVisible());
    EXPECT_TRUE(sim::call_log().empty());
    open_page();
    EXPECT_EQ(text(page.FreqTxt), "2000");

    type(page.FreqTxt, "3000");
    sim::clear_call_log();
    click(page.doneBtn);
    EXPECT_TRUE(main().isVisible());
    EXPECT_FALSE(page.isVisible());
    EXPECT_EQ(count("ost7720_setSineFreq"), 2);
    EXPECT_EQ(count("ost7720_getSineFreq"), 1);
    ASSERT_TRUE(sim::read_source(global::session, src1, view));
    EXPECT_EQ(view.sine_freq, 3000.0);

    // The page reopens on the source it showed last.
    open_page();
    type(page.SrcWhoCmbo, "3");
    click(page.cancelBtn);
    open_page();
    EXPECT_EQ(page.cur_src, 3);
    EXPECT_EQ(text(page.SrcWhoCmbo), "3");
    EXPECT_TRUE(messages.empty());
}

TEST_F(SrcFrmTest, ControlsStandInTheGridReadably) {
    SrcFrm& page = open_page();
    ASSERT_EQ(page.width(), 900);
    ASSERT_EQ(page.height(), 700);
    const std::vector<std::pair<QLabel*, const char*>> captions = {
        {page.ChanNumLbl, "Chan Number"}, {page.ActiveLbl, "Active"},   {page.ModeLbl, "Mode"},
        {page.RampLbl, "Ramp Rate"},      {page.FreqLbl, "Sine Freq"},  {page.PhaseLbl, "Sine Phase"},
        {page.OutputLbl, "Output"},       {page.SrcTrigLbl, "Trigger"}, {page.ColaLbl, "Cola"},
        {page.DutyLbl, "Duty Cycle"},     {page.SumLbl, "Sum"},         {page.SeedLbl, "Seed"},
        {page.RangeLbl, "Range"}};
    for (const auto& [label, caption] : captions)
        EXPECT_EQ(label->text().toStdString(), caption);
    EXPECT_EQ(page.PresetBtn->text().toStdString(), "Default Values");
    EXPECT_EQ(page.ApplyBtn->text().toStdString(), "Apply");
    EXPECT_EQ(page.doneBtn->text().toStdString(), "OK");
    EXPECT_EQ(page.cancelBtn->text().toStdString(), "Cancel");
    auto items = [](const QComboBox* box) {
        std::vector<std::string> out;
        for (int i = 0; i < box->count(); ++i)
            out.push_back(box->itemText(i).toStdString());
        return out;
    };
    using Items = std::vector<std::string>;
    EXPECT_EQ(items(page.ActiveCmbo), (Items{"On", "Off"}));
    EXPECT_EQ(items(page.ModeCmbo), (Items{"Sine", "Burst Sine", "Random", "Burst Random", "Zoom Random",
                                           "Burst Zoom Random", "Arbitrary", "Burst Arbitrary"}));
    EXPECT_EQ(items(page.OutputCmbo), (Items{"Normal", "Grounded", "Open", "Cal", "Multi"}));
    EXPECT_EQ(items(page.SrcTrigCmbo), (Items{"Off", "On"}));
    EXPECT_EQ(items(page.ColaCmbo), (Items{"Off", "On"}));
    EXPECT_EQ(items(page.SumCmbo), (Items{"On", "Off"}));
    for (QComboBox* box : {page.SrcWhoCmbo, page.ActiveCmbo, page.ModeCmbo, page.OutputCmbo, page.SrcTrigCmbo,
                           page.ColaCmbo, page.SumCmbo})
        EXPECT_TRUE(box->isEditable());

    // Grid of 900 x 700 px: columns of 75 px, rows of 700/18 px. First column fields at 2
    // columns, second column fields at 7, its buttons and hint box at 6.5.
    const double ru = 700.0 / 18;
    EXPECT_EQ(page.ChanNumLbl->pos(), QPoint(38, qRound(ru)));  // 37.5 px rounds to even
    EXPECT_EQ(page.SrcWhoCmbo->pos(), QPoint(150, qRound(ru)));
    EXPECT_EQ(page.SrcTrigCmbo->pos(), QPoint(150, qRound(15 * ru)));
    EXPECT_EQ(page.PresetBtn->pos(), QPoint(488, qRound(ru)));
    EXPECT_EQ(page.ApplyBtn->pos(), QPoint(488, qRound(3 * ru)));
    EXPECT_EQ(page.ColaCmbo->pos(), QPoint(525, qRound(5 * ru)));
    EXPECT_EQ(page.SeedTxt->pos(), QPoint(525, qRound(11 * ru)));
    EXPECT_EQ(page.RangeLbl->pos(), QPoint(412, qRound(13 * ru)));
    EXPECT_EQ(page.NoteTxt->pos(), QPoint(488, qRound(15 * ru)));
    EXPECT_EQ(page_check::layout_faults(&page), std::vector<std::string>{});
    // "Burst Zoom Random" shows whole beside the arrow.
    EXPECT_GE(page.ModeCmbo->width(),
              page.ModeCmbo->fontMetrics().horizontalAdvance("Burst Zoom Random") + 30);
}

}  // namespace
