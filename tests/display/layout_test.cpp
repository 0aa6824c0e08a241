// The main window: layout metrics and controls from its size, the trace slots and their
// positions, channel labels and the scale boxes; and the layout procedures the pages share.
#include <QFontMetrics>
#include <QRadioButton>
#include <QTest>

#include "display/page_layout.h"
#include "display_test.h"

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
    static void type(QLineEdit* box, const char* text) {
        box->setEnabled(true);
        box->selectAll();
        QTest::keyClicks(box, text);
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

    // 15 twips a pixel. Column: BW 1041.75, BH 433.5, tops k * 606.9, left 5556 + (1389 -
    // 1041.75) / 2 = 5729.625. Go: height (8670 - 87 - 6069) / 2 = 1257 at the bottom left;
    // Exit at 6945 - 1.2 * 1041.75 = 5694.9; Trigger at 3125 - 517.5 = 2607.5, top 6206.
    const std::pair<QPushButton*, QRect> expected[] = {
        {main.MeasBtn, {382, 40, 69, 29}},  {main.InpBtn, {382, 81, 69, 29}},
        {main.SrcBtn, {382, 121, 69, 29}},  {main.DispBtn, {382, 162, 69, 29}},
        {main.VxiBtn, {382, 202, 69, 29}},  {main.GoBtn, {3, 494, 69, 84}},
        {main.ExitBtn, {380, 494, 69, 84}}, {main.TriggerBtn, {174, 414, 69, 84}},
    };
    for (const auto& [button, rect] : expected)
        EXPECT_EQ(button->geometry(), rect) << button->text().toStdString();
}

TEST_F(MainLayoutTest, SmallWindowGrowsToTheMinimumAndWideWindowsDoNotOverflow) {
    MainFrm& main = forms::get<MainFrm>();
    main.setWidth(2000);
    main.setHeight(2000);
    main.Form_Resize();
    EXPECT_DOUBLE_EQ(main.Width(), 3000.0);
    EXPECT_DOUBLE_EQ(main.Height(), 3000.0);
    main.setWidth(4500);  // only the height is too small: the width stays
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

// Slots with a channel above 0 fill the trace area in equal bands, in slot order from the top;
// the pictures start 5 twips into their band. The scale boxes are level with the picture's top
// and bottom (and disabled), the label between them reads "Chan " and the channel.
TEST_F(MainLayoutTest, ShownSlotsFillTheTraceAreaFromTheTopAndTheRestAreHiddenAndDisabled) {
    MainFrm& main = designed_window();
    const QFontMetrics fm(main.font());
    struct Case {
        std::array<int32_t, 5> channels;
        int height;  // pixels
        std::vector<int> tops;
        std::vector<const char*> labels;
    };
    const Case cases[] = {
        {{-3, 0, 12, 0, 0}, 404, {6}, {"Chan 12"}},              // 6064 twips at 92; a negative id is off
        {{1, 0, 0, 2, 0}, 202, {6, 208}, {"Chan 1", "Chan 2"}},  // 3029.5 at 92 and 3126.5
        {{3, 1, 4, 2, 0}, 101, {6, 107, 208, 310}, {"Chan 3", "Chan 1", "Chan 4", "Chan 2"}},
        {{0, 0, 0, 0, 0}, 0, {}, {}},  // after all four were shown
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.tops.size());
        global::trace_channel = c.channels;
        main.trace_update();
        for (size_t i = 0; i < 4; ++i) {
            SCOPED_TRACE(i);
            const bool shown = i < c.tops.size();
            for (QWidget* w : std::initializer_list<QWidget*>{main.CRTpic[i], main.HighTxt[i], main.LowTxt[i],
                                                              main.ChanLbl[i]})
                EXPECT_EQ(w->isHidden(), !shown);
            EXPECT_EQ(main.CRTpic[i]->isEnabled(), shown);
            EXPECT_EQ(main.ChanLbl[i]->isEnabled(), shown);
            EXPECT_FALSE(main.HighTxt[i]->isEnabled() || main.LowTxt[i]->isEnabled());
            if (!shown)
                continue;
            const int top = c.tops[i], th = fm.height();
            EXPECT_EQ(main.CRTpic[i]->geometry(), QRect(46, top, 324, c.height));
            EXPECT_EQ(main.HighTxt[i]->geometry(), QRect(0, top, 46, th));
            EXPECT_EQ(main.LowTxt[i]->geometry(), QRect(0, top + c.height - th, 46, th));
            EXPECT_EQ(main.ChanLbl[i]->text(), c.labels[i]);
            EXPECT_EQ(main.ChanLbl[i]->x(), 0);
            EXPECT_NEAR(main.ChanLbl[i]->y(), top + (c.height - th) / 2.0, 1.0);
            EXPECT_EQ(main.ChanLbl[i]->width(), fm.horizontalAdvance(c.labels[i]));
        }
    }
}

TEST_F(MainLayoutTest, ScaleBoxesShowTheRangeAndTypedNumbersSetTheLimits) {
    MainFrm& main = designed_window();
    global::trace_channel = {1, 2, 0, 0, 0};
    global::trace_range = {10, 0.5, 0, 0, 0};
    main.trace_update();
    EXPECT_EQ(main.HighTxt[0]->text(), " 10");  // rewritten with the leading blank
    EXPECT_EQ(main.LowTxt[0]->text(), "-10");
    EXPECT_EQ(main.HighTxt[1]->text(), " .5");
    EXPECT_EQ(main.LowTxt[1]->text(), "-.5");
    EXPECT_EQ(global::trace_high, (std::array<double, 5>{10, 0.5, 1, 1, 1}));  // slots not shown keep theirs
    EXPECT_EQ(global::trace_low, (std::array<double, 5>{-10, -0.5, -1, -1, -1}));

    // Text that is not a number stays as typed and the limit keeps its value; a number is
    // stored and rewritten in the standard form.
    QLineEdit* high = main.HighTxt[0];
    type(high, "abc");
    EXPECT_EQ(high->text(), "abc");
    EXPECT_EQ(global::trace_high[0], 10.0);
    type(high, "7");
    EXPECT_EQ(high->text(), " 7");
    EXPECT_EQ(global::trace_high[0], 7.0);
    QTest::keyClicks(high, "x");
    EXPECT_EQ(high->text(), " 7x");
    EXPECT_EQ(global::trace_high[0], 7.0);
    type(main.LowTxt[1], "-25");
    EXPECT_EQ(main.LowTxt[1]->text(), "-25");
    EXPECT_EQ(global::trace_low, (std::array<double, 5>{-10, -25, -1, -1, -1}));
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
    EXPECT_EQ(global::trace_high, (std::array<double, 5>{1, 10, 1, 0.25, 1}));
    EXPECT_EQ(global::trace_low, (std::array<double, 5>{-1, -10, -1, -0.25, -1}));

    type(main.HighTxt[1], "5");  // the box at position 1 sets slot 3's scale
    EXPECT_EQ(global::trace_high, (std::array<double, 5>{1, 10, 1, 5, 1}));

    // A slot moving to a position whose box already shows its text still gets the value:
    // slot 2 with slot 1's range takes position 0, and the low box's "-10" does not change.
    global::trace_channel = {0, 0, 5, 0, 0};
    global::trace_range[2] = 10;
    main.trace_update();
    EXPECT_EQ(main.LowTxt[0]->text(), "-10");
    EXPECT_EQ(global::trace_high[2], 10.0);
    EXPECT_EQ(global::trace_low[2], -10.0);
}

// A page of 640 x 480 pixels, 9600 x 7200 twips: RU = 400, CU = 800.
struct GridPage : Form {
    GridPage() : Form(QStringLiteral("Grid")) { resize(640, 480); }
    QPushButton* ok = new QPushButton(QStringLiteral("OK"), this);
    QPushButton* cancel = new QPushButton(QStringLiteral("Cancel"), this);
    QLabel* label = new QLabel(QStringLiteral("Range"), this);
    QPushButton* field = new QPushButton(QStringLiteral("field"), this);
    QRadioButton* option = new QRadioButton(QStringLiteral("Single Block"), this);
};

class PageLayoutTest : public PanelTest {};

TEST_F(PageLayoutTest, OkAndCancelSitAtTheLowerLeftOneEighthWide) {
    GridPage& page = forms::get<GridPage>();
    ASSERT_DOUBLE_EQ(page.Width(), 9600.0);
    place_ok_cancel(page, page.ok, page.cancel);
    // 1200 x 480 twips; OK at 600, top 7200 - 720 - 400 = 6080; Cancel at 600 + 1800.
    EXPECT_EQ(page.ok->geometry(), QRect(40, 405, 80, 32));
    EXPECT_EQ(page.cancel->geometry(), QRect(160, 405, 80, 32));
}

TEST_F(PageLayoutTest, GridPlacesByIndexAndKindAndSizesLabelsAndOptionButtons) {
    GridPage& page = forms::get<GridPage>();
    struct Case {
        int16_t index, kind;
        QPoint pos;
    } const cases[] = {
        {9, 2, {373, 80}},   // row 1 of the second column: Top 3 RU = 1200, Left 7 CU = 5600
        {3, 0, {80, 187}},   // Top 400 + 3 * 800 = 2800, Left 400 + 800
        {8, 5, {293, 27}},   // any other kind: first row of the second column, Left 400 + 4000
        {-1, 3, {27, -27}},  // a negative index keeps its sign through mod: Top 400 - 800
    };
    for (const Case& c : cases) {
        place_in_grid(page, page.field, c.index, c.kind);
        EXPECT_EQ(page.field->pos(), c.pos) << c.index << " kind " << c.kind;
    }
    // Kind 1, a label: its caption's width plus 5 twips, 300 twips high, at the column's left.
    const QFontMetrics fm(page.font());
    place_in_grid(page, page.label, 7, 1);
    EXPECT_EQ(page.label->geometry(), QRect(27, 400, fm.horizontalAdvance(QStringLiteral("Range")), 20));
    // An option button: its caption's width plus 300 twips, one text line high.
    size_option_button(page, page.option);
    EXPECT_EQ(page.option->size(),
              QSize(fm.horizontalAdvance(QStringLiteral("Single Block")) + 20, fm.height()));
}

}  // namespace
