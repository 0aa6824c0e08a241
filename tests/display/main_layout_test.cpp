// The main window: layout metrics and controls from its size, the trace slots and their
// positions, channel labels, and the scale boxes.
#include <gtest/gtest.h>

#include <QFontMetrics>
#include <QTest>

#include "core/global.h"
#include "core/windows.h"
#include "display/MainFrm.h"
#include "panel_fixture.h"

namespace {

class MainLayoutTest : public PanelTest {
  protected:
    // The designed inner size, 6945 x 8670 twips, laid out.
    MainFrm& designed_window() {
        MainFrm& main = forms::get<MainFrm>();
        main.resize(463, 578);
        main.Form_Resize();
        return main;
    }

    static int text_height_px(const MainFrm& main) { return QFontMetrics(main.font()).height(); }

    static void expect_geometry(const QWidget* w, int x, int y, int width, int height) {
        EXPECT_EQ(w->x(), x) << w->metaObject()->className();
        EXPECT_EQ(w->y(), y) << w->metaObject()->className();
        EXPECT_EQ(w->width(), width) << w->metaObject()->className();
        EXPECT_EQ(w->height(), height) << w->metaObject()->className();
    }
};

TEST_F(MainLayoutTest, DesignedSizeGivesTheMetricsAndButtonPlaces) {
    MainFrm& main = designed_window();
    ASSERT_DOUBLE_EQ(main.ScaleWidth(), 6945.0);
    ASSERT_DOUBLE_EQ(main.ScaleHeight(), 8670.0);
    EXPECT_EQ(global::trace_area_width, 4862);  // 4861.5 to even
    EXPECT_EQ(global::trace_area_left, 694);    // 694.5 to even
    EXPECT_EQ(global::trace_area_top, 87);      // 86.7
    EXPECT_EQ(global::trace_area_height, 6069);

    // Column: BW 1041.75, BH 433.5, BS 606.9, BX = 5556 + (1389 - 1041.75) / 2 = 5729.625;
    // twips become whole pixels at 15 twips per pixel.
    expect_geometry(main.MeasBtn, 382, 40, 69, 29);   // Top 606.9
    expect_geometry(main.InpBtn, 382, 81, 69, 29);    // 1213.8
    expect_geometry(main.SrcBtn, 382, 121, 69, 29);   // 1820.7
    expect_geometry(main.DispBtn, 382, 162, 69, 29);  // 2427.6
    expect_geometry(main.VxiBtn, 382, 202, 69, 29);   // 3034.5
    EXPECT_NEAR(twips::top(main.MeasBtn), 606.9, 15.0);
    EXPECT_NEAR(twips::top(main.VxiBtn), 3034.5, 15.0);

    // Go: height (8670 - 87 - 6069) / 2 = 1257, at the bottom left; Exit beside it at
    // 6945 - 1.2 * 1041.75 = 5694.9; Trigger centred under the trace area at 6206.
    expect_geometry(main.GoBtn, 3, 494, 69, 84);
    EXPECT_NEAR(twips::height(main.GoBtn), 1257.0, 15.0);
    EXPECT_NEAR(twips::top(main.GoBtn), 7413.0, 15.0);
    EXPECT_EQ(main.GoBtn->y() + main.GoBtn->height(), 578);
    expect_geometry(main.ExitBtn, 380, 494, 69, 84);
    expect_geometry(main.TriggerBtn, 174, 414, 69, 84);  // Left 3125 - 517.5 = 2607.5
    EXPECT_NEAR(twips::top(main.TriggerBtn), 6206.0, 15.0);
}

TEST_F(MainLayoutTest, SmallWindowGrowsToTheMinimumAndWideWindowsDoNotOverflow) {
    MainFrm& main = forms::get<MainFrm>();
    main.setWidth(2000);
    main.setHeight(2000);
    main.Form_Resize();
    EXPECT_DOUBLE_EQ(main.Width(), 3000.0);
    EXPECT_DOUBLE_EQ(main.Height(), 3000.0);

    // Only the height is too small: the width stays.
    main.setWidth(4500);
    main.setHeight(1500);
    main.Form_Resize();
    EXPECT_DOUBLE_EQ(main.Width(), 4500.0);
    EXPECT_DOUBLE_EQ(main.Height(), 3000.0);

    // 3000 px = 45000 twips wide: beyond what 16-bit metrics could hold.
    main.resize(3000, 2400);
    main.Form_Resize();
    EXPECT_EQ(global::trace_area_width, 31500);
    EXPECT_EQ(global::trace_area_left, 4500);
    EXPECT_EQ(global::trace_area_height, 25200);
    // R = 36000 and the column sits centred right of it: 36000 + (9000 - 6750) / 2.
    EXPECT_EQ(main.MeasBtn->x(), 2475);
    EXPECT_EQ(main.ExitBtn->x(), 3000 - 540);
}

TEST_F(MainLayoutTest, TriggerShownOnlyForManualTriggerAndAlwaysDisabled) {
    MainFrm& main = forms::get<MainFrm>();
    main.resize(463, 578);
    for (int16_t source : {0, 1, 2, 3}) {
        global::trigger_source = source;
        main.TriggerBtn->setEnabled(true);
        main.Form_Resize();
        EXPECT_EQ(!main.TriggerBtn->isHidden(), source == 1) << source;
        EXPECT_FALSE(main.TriggerBtn->isEnabled()) << source;
    }
}

TEST_F(MainLayoutTest, AllSlotsOffHidesAndDisablesEveryTraceControl) {
    MainFrm& main = designed_window();
    global::trace_channel = {1, 2, 3, 4, 0};
    main.trace_update();
    global::trace_channel = {0, 0, 0, 0, 0};
    main.trace_update();
    for (int i = 0; i < 4; ++i) {
        for (QWidget* w : std::initializer_list<QWidget*>{main.CRTpic[i], main.HighTxt[i], main.LowTxt[i],
                                                          main.ChanLbl[i]}) {
            EXPECT_TRUE(w->isHidden()) << i;
            EXPECT_FALSE(w->isEnabled()) << i;
        }
    }
}

TEST_F(MainLayoutTest, SlotsFillTheTraceAreaInBandsFromTheTop) {
    MainFrm& main = designed_window();
    const int th = text_height_px(main);

    // Only "Trace #3": its picture takes the whole area at position 0: top 87 + 5, height
    // 6069 - 5 = 6064 twips.
    global::trace_channel = {0, 0, 7, 0, 0};
    main.trace_update();
    expect_geometry(main.CRTpic[0], 46, 6, 324, 404);
    EXPECT_FALSE(main.CRTpic[0]->isHidden());
    EXPECT_TRUE(main.CRTpic[0]->isEnabled());
    EXPECT_EQ(main.ChanLbl[0]->text(), "Chan 7");
    for (int i = 1; i < 4; ++i)
        EXPECT_TRUE(main.CRTpic[i]->isHidden());
    // Boxes level with the picture's top and bottom, the label between them.
    expect_geometry(main.HighTxt[0], 0, 6, 46, th);
    expect_geometry(main.LowTxt[0], 0, 6 + 404 - th, 46, th);
    EXPECT_FALSE(main.HighTxt[0]->isEnabled());
    EXPECT_FALSE(main.LowTxt[0]->isHidden());
    EXPECT_NEAR(main.ChanLbl[0]->y(), (main.HighTxt[0]->y() + main.LowTxt[0]->y()) / 2.0, 1.0);
    EXPECT_EQ(main.ChanLbl[0]->x(), 0);

    // Two slots: bands of 3034.5 twips, pictures 3029.5 high at 92 and 3126.5.
    global::trace_channel = {1, 0, 0, 2, 0};
    main.trace_update();
    expect_geometry(main.CRTpic[0], 46, 6, 324, 202);
    expect_geometry(main.CRTpic[1], 46, 208, 324, 202);
    EXPECT_EQ(main.ChanLbl[0]->text(), "Chan 1");
    EXPECT_EQ(main.ChanLbl[1]->text(), "Chan 2");
    EXPECT_TRUE(main.CRTpic[2]->isHidden());
    EXPECT_TRUE(main.HighTxt[2]->isHidden());

    // Four slots: bands of 1517.25, pictures 1512.25 high at 92, 1609.25, 3126.5, 4643.75.
    global::trace_channel = {3, 1, 4, 2, 0};
    main.trace_update();
    const int tops[4] = {6, 107, 208, 310};
    for (int i = 0; i < 4; ++i) {
        expect_geometry(main.CRTpic[i], 46, tops[i], 324, 101);
        EXPECT_EQ(main.HighTxt[i]->y(), tops[i]);
        EXPECT_EQ(main.LowTxt[i]->y(), tops[i] + 101 - th);
        EXPECT_FALSE(main.ChanLbl[i]->isHidden());
        EXPECT_TRUE(main.ChanLbl[i]->isEnabled());
    }
    EXPECT_EQ(main.ChanLbl[0]->text(), "Chan 3");
    EXPECT_EQ(main.ChanLbl[3]->text(), "Chan 2");
}

TEST_F(MainLayoutTest, LabelReadsChanAndTheChannelAndIsExactlyAsWideAsItsText) {
    MainFrm& main = designed_window();
    global::trace_channel = {12, 0, 0, 0, 0};
    main.trace_update();
    EXPECT_EQ(main.ChanLbl[0]->text(), "Chan 12");
    EXPECT_EQ(main.ChanLbl[0]->width(), QFontMetrics(main.font()).horizontalAdvance("Chan 12"));
    // A negative id is a slot that is off.
    global::trace_channel = {-3, 0, 0, 0, 0};
    main.trace_update();
    EXPECT_TRUE(main.ChanLbl[0]->isHidden());
}

TEST_F(MainLayoutTest, ScaleBoxesShowTheRangeAndStoreTheLimits) {
    MainFrm& main = designed_window();
    global::trace_channel = {1, 2, 0, 0, 0};
    global::trace_range = {10, 0.5, 0, 0, 0};
    main.trace_update();
    EXPECT_EQ(main.HighTxt[0]->text(), " 10");  // rewritten with the leading blank
    EXPECT_EQ(main.LowTxt[0]->text(), "-10");
    EXPECT_EQ(main.HighTxt[1]->text(), " .5");
    EXPECT_EQ(main.LowTxt[1]->text(), "-.5");
    EXPECT_EQ(global::trace_high[0], 10.0);
    EXPECT_EQ(global::trace_low[0], -10.0);
    EXPECT_EQ(global::trace_high[1], 0.5);
    EXPECT_EQ(global::trace_low[1], -0.5);
    EXPECT_EQ(global::trace_high[2], 1.0);  // slots not shown keep their limits

    // The user types into an enabled box: text that is not a number stays as typed and the
    // limit keeps its value; a number is stored and rewritten in the standard form.
    QLineEdit* high = main.HighTxt[0];
    high->setEnabled(true);
    high->clear();
    QTest::keyClicks(high, "abc");
    EXPECT_EQ(high->text(), "abc");
    EXPECT_EQ(global::trace_high[0], 10.0);
    high->selectAll();
    QTest::keyClicks(high, "7");
    EXPECT_EQ(high->text(), " 7");
    EXPECT_EQ(global::trace_high[0], 7.0);
    QTest::keyClicks(high, "x");
    EXPECT_EQ(high->text(), " 7x");
    EXPECT_EQ(global::trace_high[0], 7.0);

    QLineEdit* low = main.LowTxt[1];
    low->setEnabled(true);
    low->selectAll();
    QTest::keyClicks(low, "-25");
    EXPECT_EQ(low->text(), "-25");
    EXPECT_EQ(global::trace_low[1], -25.0);
    EXPECT_EQ(global::trace_low[0], -10.0);
}

// The boxes beside a picture belong to the slot that picture shows, also when slots that are
// off come before it.
TEST_F(MainLayoutTest, ScaleBoxesBelongToTheSlotShownBesideThem) {
    MainFrm& main = designed_window();
    global::trace_channel = {0, 2, 0, 4, 0};
    global::trace_range = {0.5, 10, 2, 0.25, 0};
    main.trace_update();
    EXPECT_EQ(main.ChanLbl[0]->text(), "Chan 2");
    EXPECT_EQ(main.HighTxt[0]->text(), " 10");
    EXPECT_EQ(main.LowTxt[1]->text(), "-.25");
    EXPECT_EQ(global::trace_high[1], 10.0);
    EXPECT_EQ(global::trace_low[1], -10.0);
    EXPECT_EQ(global::trace_high[3], 0.25);
    EXPECT_EQ(global::trace_low[3], -0.25);
    EXPECT_EQ(global::trace_high[0], 1.0);
    EXPECT_EQ(global::trace_low[0], -1.0);
    EXPECT_EQ(global::trace_high[2], 1.0);

    // Typing into the box at position 1 sets slot 3's scale.
    main.HighTxt[1]->setEnabled(true);
    main.HighTxt[1]->selectAll();
    QTest::keyClicks(main.HighTxt[1], "5");
    EXPECT_EQ(global::trace_high[3], 5.0);
    EXPECT_EQ(global::trace_high[1], 10.0);

    // A slot moving to a position whose box already shows its text still gets the value:
    // slot 1 (range 10) gives way to slot 2 with the same range at position 0, and the low
    // box's "-10" does not change.
    global::trace_channel = {0, 0, 5, 0, 0};
    global::trace_range[2] = 10;
    main.trace_update();
    EXPECT_EQ(main.LowTxt[0]->text(), "-10");
    EXPECT_EQ(global::trace_high[2], 10.0);
    EXPECT_EQ(global::trace_low[2], -10.0);
}

}  // namespace
