// Window geometry in twips and the page switch.
#include <gtest/gtest.h>

#include "core/Form.h"
#include "core/windows.h"
#include "panel_fixture.h"

namespace {

class CountingForm : public Form {
  public:
    CountingForm() : Form(QStringLiteral("Counting")) {}
    void Form_Resize() override { ++layouts; }
    int layouts = 0;
};

class PageA : public CountingForm {};
class PageB : public CountingForm {};

class FormTest : public PanelTest {};

TEST_F(FormTest, TwipsRoundToWholePixelsAndNonsenseDoesNotOverflow) {
    PageA& f = forms::get<PageA>();
    ASSERT_DOUBLE_EQ(f.twips_per_pixel_x(), 15.0);
    f.setWidth(6945 + 7);  // 463.47 px -> 463
    f.setHeight(8670);
    f.setLeft(1500);
    f.setTop(-300);
    EXPECT_DOUBLE_EQ(f.Width(), 6945.0);
    EXPECT_DOUBLE_EQ(f.ScaleHeight(), 8670.0);
    EXPECT_DOUBLE_EQ(f.Left(), 1500.0);
    EXPECT_DOUBLE_EQ(f.Top(), -300.0);

    f.setWidth(1e300);
    f.setHeight(-1e300);
    f.setLeft(std::numeric_limits<double>::quiet_NaN());
    EXPECT_GE(f.width(), 1);
    EXPECT_GE(f.height(), 1);
}

TEST_F(FormTest, SwitchPageHandsOverPlaceAndLaysTheTargetOutOnce) {
    PageA& a = forms::get<PageA>();
    PageB& b = forms::get<PageB>();
    EXPECT_EQ(&forms::get<PageA>(), &a);  // one instance per window
    a.setLeft(1500);
    a.setTop(1200);
    a.setWidth(6000);
    a.setHeight(4500);
    a.show();
    const int before = b.layouts;
    switch_page(a, b);
    EXPECT_EQ(b.layouts - before, 1);
    EXPECT_TRUE(b.isVisible() && b.isEnabled());
    EXPECT_FALSE(a.isVisible() || a.isEnabled());
    EXPECT_EQ(b.frameGeometry(), a.frameGeometry());

    // The user moves and resizes the page; going back brings the first window to the new place.
    b.setLeft(3000);
    b.setWidth(7500);
    switch_page(b, a);
    EXPECT_DOUBLE_EQ(a.Left(), 3000.0);
    EXPECT_DOUBLE_EQ(a.Width(), 7500.0);
    EXPECT_DOUBLE_EQ(a.Top(), 1200.0);
    EXPECT_TRUE(a.isVisible());
    EXPECT_FALSE(b.isVisible());
}

}  // namespace
