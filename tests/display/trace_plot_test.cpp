// Drawing a block into a picture: the mapping to pixels, the grid, clamping, what draws nothing,
// and trace_update's pictures.
#include <limits>

#include "display_test.h"

namespace {

const QRgb grey = qRgb(128, 128, 128);
constexpr double nan = std::numeric_limits<double>::quiet_NaN();
constexpr double inf = std::numeric_limits<double>::infinity();

class TracePlotTest : public PanelTest {
  protected:
    // 200 x 100 pixels. With x1 = 0, w = 100 and y1 = 1, h = 2 the user scale runs from -1 to
    // 101 across and from 1.02 down to -1.02: x lands in column floor((x + 1) * 200 / 102), y in
    // row floor((1.02 - y) * 100 / 2.04).
    void SetUp() override {
        PanelTest::SetUp();
        pic.resize(200, 100);
        for (int k = 0; k < 100; ++k)
            xs.push_back(static_cast<float>(k + 1));
    }
    void plot(const std::vector<double>& ys, int n) {
        plot_trace(pic, 0, 1, 100, 2, xs.data(), ys.data(), n);
    }
    bool is_fg(int x, int y) const { return pic.image().pixel(x, y) == pic.foreground().rgb(); }
    int fg_count() const { return count_pixels(pic.image(), pic.foreground().rgb()); }

    PictureBox pic;
    std::vector<float> xs;
};

TEST_F(TracePlotTest, ClampRaisesToLowThenLowersToHigh) {
    EXPECT_EQ(clamp_value(5, -1, 1), 1);
    EXPECT_EQ(clamp_value(-5, -1, 1), -1);
    EXPECT_EQ(clamp_value(0, 2, 1), 1);  // low above high: high wins, as the order says
}

TEST_F(TracePlotTest, GridLinesLieWhereTheMarginsPutThem) {
    plot({}, 0);  // grid only
    ASSERT_EQ(pic.image().size(), QSize(200, 100));
    // Horizontal line k at 1.02 - k / 4: rows 0, 12.25, 24.5, 36.8, 49.0, 61.3, 73.5, 85.8.
    const std::set<int> rows = {0, 12, 24, 36, 49, 61, 73, 85};
    // Vertical line k at -1 + 10 k: columns 0, 19.6, 39.2, 58.8, 78.4, 98.04, 117.6, 137.3,
    // 156.9, 176.5; none on the right edge.
    const std::set<int> cols = {0, 19, 39, 58, 78, 98, 117, 137, 156, 176};
    for (int y = 0; y < 100; ++y)
        for (int x = 0; x < 200; ++x)
            ASSERT_EQ(pic.image().pixel(x, y), rows.count(y) || cols.count(x) ? grey : pic.background().rgb())
                << x << "," << y;
}

TEST_F(TracePlotTest, SamplesLandOnTheirPixelsAndOutOfRangeOnesOnTheMarginEdges) {
    std::vector<float> x3 = {1, 40, 90};
    std::vector<double> y3 = {0.3, 1000, -1000};
    plot_trace(pic, 0, 1, 100, 2, x3.data(), y3.data(), 3);
    EXPECT_TRUE(is_fg(3, 35));  // x = 1: column 3.92; 0.3: row 35.29
    // 1000 is clamped to 1.02, the top edge: row 0; x = 40: column 80.4.
    EXPECT_TRUE(is_fg(80, 0));
    EXPECT_FALSE(is_fg(80, 1));
    // -1000 is clamped to -1.02, the bottom edge, which belongs to the last row; x = 90: column 178.4.
    EXPECT_TRUE(is_fg(178, 99));
    // The first line runs from (3, 35) to (80, 0): in column 42 it is at row 35 - 39 * 35 / 77 = 17.3.
    EXPECT_TRUE(is_fg(42, 17));
    EXPECT_FALSE(is_fg(42, 16) || is_fg(42, 18) || is_fg(150, 10));

    // One sample: the grid and one pixel, at column 3.92, row 74.5 for -0.5.
    plot({-0.5}, 1);
    EXPECT_EQ(fg_count(), 1);
    EXPECT_TRUE(is_fg(3, 74));

    // Arrays shorter than n: only what they hold (x = 1 .. 10, columns 3 .. 21) is drawn.
    std::vector<double> ten(10, 0.3);
    plot_trace(pic, 0, 1, 100, 2, std::span<const float>(xs), std::span<const double>(ten), 100);
    EXPECT_TRUE(is_fg(21, 35));
    EXPECT_FALSE(is_fg(30, 35));

    // A sample that is not a number leaves a gap instead of a wild line: samples 59 and 61 sit
    // at x = 60 and 62 (columns 119.6 and 123.5), and the segments into and out of sample 60
    // are not drawn.
    std::vector<double> ys(100, 0.3);
    ys[60] = nan;
    plot(ys, 100);
    for (int x = 118; x <= 124; ++x)
        EXPECT_EQ(is_fg(x, 35), x < 120 || x > 122) << x;
}

TEST_F(TracePlotTest, ZeroOrNonFiniteScaleLeavesThePictureClearedWithoutFailing) {
    const std::vector<double> ys(100, 0.3);
    struct Case {
        double y1, w, h;
    } const cases[] = {{1, 100, 0}, {nan, 100, 2}, {1, 0, 2}, {1, inf, 2}};  // high == low, no points yet
    for (const Case& c : cases) {
        plot(ys, 100);
        ASSERT_GT(fg_count(), 0);
        plot_trace(pic, 0, c.y1, c.w, c.h, xs.data(), ys.data(), 100);
        EXPECT_EQ(count_pixels(pic.image(), pic.background().rgb()), 200 * 100)
            << c.y1 << " " << c.w << " " << c.h;
    }
}

TEST_F(TracePlotTest, PictureKeepsItsDrawingWhenItGrows) {
    plot(std::vector<double>(100, 0.3), 100);
    pic.resize(300, 150);
    pic.line(-1e300, 0, -1e300, 0, Qt::red);  // a drawing call (here of nothing) brings the new size
    EXPECT_EQ(pic.image().size(), QSize(300, 150));
    EXPECT_TRUE(is_fg(3, 35));
    EXPECT_EQ(pic.image().pixel(250, 120), pic.background().rgb());
}

class TraceUpdateTest : public PanelTest {
  protected:
    MainFrm& window_with_block(int points) {
        MainFrm& main = forms::get<MainFrm>();
        main.resize(463, 578);
        main.Form_Resize();
        global::num_points = points;
        global::x_values.resize(points + 1);
        for (int k = 0; k < points; ++k)
            global::x_values[k] = static_cast<float>(k + 1);
        for (int t = 0; t < 4; ++t)
            global::trace_data(t).assign(points + 1, 0.0);
        return main;
    }
    static bool drawn(const PictureBox* pic) {
        return count_pixels(pic->image(), pic->background().rgb()) !=
               pic->image().width() * pic->image().height();
    }
};

TEST_F(TraceUpdateTest, FrequencyDataDrawsHalfThePoints) {
    MainFrm& main = window_with_block(1024);
    global::domain = 1;
    global::trace_channel[0] = 1;
    global::trace_range[0] = 1;
    global::trace_has_data[0] = global::flag_true;
    for (int k = 0; k < 1024; ++k)  // the lower half at 0.5, the upper at -0.5
        global::trace1_data[k] = k < 512 ? 0.5 : -0.5;
    main.trace_update();

    const PictureBox* pic = main.CRTpic[0];
    ASSERT_EQ(pic->image().size(), QSize(324, 404));
    // The x scale runs from -5.12 to 517.12: x = 1 lands in column 6.1 / 522.24 * 324 = 3.8,
    // x = 512 in 320.8; 0.5 in row (1.02 - 0.5) / 2.04 * 404 = 102.98, -0.5 in row 301.02.
    EXPECT_EQ(pic->image().pixel(3, 102), pic->foreground().rgb());
    EXPECT_EQ(pic->image().pixel(320, 102), pic->foreground().rgb());
    auto near_row_301 = [&] {
        return count_pixels(pic->image().copy(0, 300, 324, 3), pic->foreground().rgb());
    };
    EXPECT_EQ(near_row_301(), 0);
    // The vertical grid line k = 5 at -5.12 + 256: column 256 / 522.24 * 324 = 158.8.
    EXPECT_EQ(pic->image().pixel(158, 200), grey);
    // An odd block: 1023 / 2 = 511.5 rounds to 512 points.
    global::num_points = 1023;
    global::trace1_data[511] = -0.5;
    main.trace_update();
    EXPECT_GT(near_row_301(), 0);
}

TEST_F(TraceUpdateTest, OnlySlotsWithDataAreDrawnAndAStaleDrawingIsNotShownUnderAnotherLabel) {
    MainFrm& main = window_with_block(256);
    global::trace_channel = {1, 2, 0, 0, 0};
    global::trace_range = {1, 1, 1, 1, 0};
    global::trace_has_data = {global::flag_true, global::flag_false, 0, 0, 0};
    global::trace1_data.assign(257, 0.5);
    main.trace_update();
    EXPECT_TRUE(drawn(main.CRTpic[0]));
    EXPECT_FALSE(drawn(main.CRTpic[1]));  // a slot without data gets neither grid nor trace

    // Slot 0 keeps its drawing while it shows no new data...
    global::trace_has_data[0] = global::flag_false;
    main.trace_update();
    EXPECT_TRUE(drawn(main.CRTpic[0]));
    // ...but when slot 1 takes position 0, slot 0's old trace is not shown beside "Chan 2".
    global::trace_channel[0] = 0;
    main.trace_update();
    EXPECT_EQ(main.ChanLbl[0]->text(), "Chan 2");
    EXPECT_FALSE(drawn(main.CRTpic[0]));
}

}  // namespace
