// The layout procedures the setup pages share.
#include <gtest/gtest.h>

#include <QFontMetrics>
#include <QLabel>
#include <QPushButton>
#include <QRadioButton>

#include "core/windows.h"
#include "display/page_layout.h"
#include "panel_fixture.h"

namespace {

class GridPage : public Form {
  public:
    GridPage() : Form(QStringLiteral("Grid")) {
        ok = new QPushButton(QStringLiteral("OK"), this);
        cancel = new QPushButton(QStringLiteral("Cancel"), this);
        label = new QLabel(QStringLiteral("Range"), this);
        field = new QPushButton(QStringLiteral("field"), this);
        option = new QRadioButton(QStringLiteral("Single Block"), this);
        resize(640, 480);  // 9600 x 7200 twips: RU = 400, CU = 800
    }
    QPushButton* ok;
    QPushButton* cancel;
    QLabel* label;
    QPushButton* field;
    QRadioButton* option;
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

TEST_F(PageLayoutTest, GridRowsAndColumnsByIndexAndKind) {
    GridPage& page = forms::get<GridPage>();

    // Index 9, kind 2: row 1 of the second column, Top 3 RU = 1200, Left 7 CU = 5600.
    place_in_grid(page, page.field, 9, 2);
    EXPECT_EQ(page.field->pos(), QPoint(373, 80));
    // Index 3, kind 0: Top 400 + 3 * 800 = 2800, Left 400 + 800.
    place_in_grid(page, page.field, 3, 0);
    EXPECT_EQ(page.field->pos(), QPoint(80, 187));
    // Index 8, any other kind: first row of the second column, Left 400 + 4000.
    place_in_grid(page, page.field, 8, 5);
    EXPECT_EQ(page.field->pos(), QPoint(293, 27));
    // A negative index keeps its sign through mod: Top 400 - 800.
    place_in_grid(page, page.field, -1, 3);
    EXPECT_EQ(page.field->pos(), QPoint(27, -27));

    // Kind 1, a label: sized to its caption plus 5 twips, 300 twips high, at the column's left.
    place_in_grid(page, page.label, 7, 1);
    const int text = QFontMetrics(page.font()).horizontalAdvance(QStringLiteral("Range"));
    EXPECT_EQ(page.label->geometry(), QRect(27, 400, text, 20));
}

TEST_F(PageLayoutTest, OptionButtonIsItsCaptionPlus300TwipsWideAndOneLineHigh) {
    GridPage& page = forms::get<GridPage>();
    size_option_button(page, page.option);
    const QFontMetrics fm(page.font());
    EXPECT_EQ(page.option->width(), fm.horizontalAdvance(QStringLiteral("Single Block")) + 20);
    EXPECT_EQ(page.option->height(), fm.height());
}

}  // namespace
