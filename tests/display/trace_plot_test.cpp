// Drawing a block into a picture: the mapping to pixels, the grid, clamping, the polyline and
// its agreement with drawing one segment at a time.
#include <gtest/gtest.h>

#include <QImage>
#include <cmath>
#include <limits>
#include <random>
#include <set>
#include <utility>
#include <vector>

#include "core/global.h"
#include "core/windows.h"
#include "display/MainFrm.h"
#include "display/PictureBox.h"
#include "display/trace_plot.h"
#include "panel_fixture.h"

namespace {

const QRgb grey = qRgb(128, 128, 128);

class TracePlotTest : public PanelTest {
  protected:
    // 200 x 100 pixels. With x1 = 0, w = 100 and y1 = 1, h = 2 the user scale runs from -1 to
    // 101 across (1.96078 pixels per unit) and from 1.02 down to -1.02 (49.0196 pixels per
    // unit): x lands in column floor((x + 1) * 200 / 102), y in row floor((1.02 - y) * 100 / 2.04).
    void SetUp() override {
        PanelTest::SetUp();
        pic.resize(200, 100);
        for (int k = 0; k < 100; ++k)
            xs.push_back(static_cast<float>(k + 1));
    }

    QRgb px(int x, int y) const { return pic.image().pixel(x, y); }
    QRgb fg() const { return pic.foreground().rgb(); }
    QRgb bg() const { return pic.background().rgb(); }

    int count(QRgb color) const {
        int n = 0;
        const QImage& img = pic.image();
        for (int y = 0; y < img.height(); ++y)
            for (int x = 0; x < img.width(); ++x)
                n += img.pixel(x, y) == color;
        return n;
    }

    PictureBox pic;
    std::vector<float> xs;
};

TEST_F(TracePlotTest, ClampRaisesToLowThenLowersToHigh) {
    EXPECT_EQ(clamp_value(5, -1, 1), 1);
    EXPECT_EQ(clamp_value(-5, -1, 1), -1);
    EXPECT_EQ(clamp_value(0.25, -1, 1), 0.25);
    EXPECT_EQ(clamp_value(0, 2, 1), 1);  // low above high: high wins, as the order says
}

TEST_F(TracePlotTest, GridLinesLieWhereTheMarginsPutThem) {
    std::vector<double> ys(100, 0.3);
    plot_trace(pic, 0, 1, 100, 2, xs.data(), ys.data(), 0);  // grid only
    ASSERT_EQ(pic.image().width(), 200);
    ASSERT_EQ(pic.image().height(), 100);
    // Horizontal line k at 1.02 - k / 4: rows 0, 12.25, 24.5, 36.8, 49.0, 61.3, 73.5, 85.8.
    const std::set<int> rows = {0, 12, 24, 36, 49, 61, 73, 85};
    // Vertical line k at -1 + 10 k: columns 0, 19.6, 39.2, 58.8, 78.4, 98.04, 117.6, 137.3,
    // 156.9, 176.5; none on the right edge.
    const std::set<int> cols = {0, 19, 39, 58, 78, 98, 117, 137, 156, 176};
    for (int y = 0; y < 100; ++y)
        for (int x = 0; x < 200; ++x) {
            const bool grid = rows.count(y) || cols.count(x);
            ASSERT_EQ(px(x, y), grid ? grey : bg()) << x << "," << y;
        }
}

TEST_F(TracePlotTest, SamplesLandOnTheirPixelsAndOutOfRangeOnesOnTheMarginEdges) {
    // Three samples: 0.3 at x = 1, 1000 at x = 40, -1000 at x = 90.
    std::vector<float> x3 = {1, 40, 90};
    std::vector<double> y3 = {0.3, 1000, -1000};
    plot_trace(pic, 0, 1, 100, 2, x3.data(), y3.data(), 3);
    // x = 1: column 3.92; 0.3: row 35.29.
    EXPECT_EQ(px(3, 35), fg());
    // 1000 is clamped to 1.02, the top edge: row 0; x = 40: column 80.4.
    EXPECT_EQ(px(80, 0), fg());
    EXPECT_NE(px(80, 1), fg());
    // -1000 is clamped to -1.02, the bottom edge, which belongs to the last row; x = 90:
    // column 178.4.
    EXPECT_EQ(px(178, 99), fg());
    // The first line runs in device space from (3, 35) to (80, 0): in column 42 it is at row
    // 35 - 39 * 35 / 77 = 17.3.
    EXPECT_EQ(px(42, 17), fg());
    EXPECT_NE(px(42, 16), fg());
    EXPECT_NE(px(42, 18), fg());
    EXPECT_NE(px(150, 10), fg());
}

TEST_F(TracePlotTest, OneSampleDrawsTheGridAndOnePixel) {
    std::vector<double> ys = {-0.5};
    plot_trace(pic, 0, 1, 100, 2, xs.data(), ys.data(), 1);
    EXPECT_EQ(count(fg()), 1);
    EXPECT_EQ(px(3, 74), fg());  // x = 1: column 3.92; -0.5: row 74.5
}

TEST_F(TracePlotTest, ZeroOrNonFiniteScaleLeavesThePictureClearedWithoutFailing) {
    std::vector<double> ys(100, 0.3);
    plot_trace(pic, 0, 1, 100, 2, xs.data(), ys.data(), 100);
    ASSERT_GT(count(fg()), 0);
    plot_trace(pic, 0, 1, 100, 0, xs.data(), ys.data(), 100);  // high == low
    EXPECT_EQ(count(bg()), 200 * 100);
    plot_trace(pic, 0, 1, 100, 2, xs.data(), ys.data(), 100);
    plot_trace(pic, 0, std::numeric_limits<double>::quiet_NaN(), 100, 2, xs.data(), ys.data(), 100);
    EXPECT_EQ(count(bg()), 200 * 100);
    plot_trace(pic, 0, 1, 0, 2, xs.data(), ys.data(), 100);  // no points yet
    EXPECT_EQ(count(bg()), 200 * 100);
    plot_trace(pic, 0, 1, std::numeric_limits<double>::infinity(), 2, xs.data(), ys.data(), 100);
    EXPECT_EQ(count(bg()), 200 * 100);
}

TEST_F(TracePlotTest, NonFiniteSamplesLeaveAGapInsteadOfAWildLine) {
    std::vector<double> ys(100, 0.3);
    ys[60] = std::numeric_limits<double>::quiet_NaN();
    plot_trace(pic, 0, 1, 100, 2, xs.data(), ys.data(), 100);
    // Samples 59 and 61 sit at x = 60 and 62 (columns 119.6 and 123.5); the segments into and
    // out of the missing sample are not drawn, the rest of the trace is.
    EXPECT_EQ(px(118, 35), fg());
    EXPECT_EQ(px(119, 35), fg());
    for (int x = 120; x <= 122; ++x)
        EXPECT_NE(px(x, 35), fg()) << x;
    EXPECT_EQ(px(123, 35), fg());
    EXPECT_EQ(px(124, 35), fg());
}

TEST_F(TracePlotTest, SpanOverloadDrawsNoMoreThanTheArraysHold) {
    std::vector<double> ys(10, 0.3);
    plot_trace(pic, 0, 1, 100, 2, std::span<const float>(xs), std::span<const double>(ys), 100);
    // Samples at x = 1 .. 10 only: columns 3 .. 21.
    EXPECT_EQ(px(21, 35), fg());
    EXPECT_NE(px(30, 35), fg());
}

// Lines are rasterised to the nearest pixels; the ends are included.
TEST_F(TracePlotTest, LinesTakeTheNearestPixels) {
    pic.set_scale(0, 0, 200, 100);  // one unit per pixel, y downward
    pic.clear();
    const QColor red(255, 0, 0);
    pic.line(10.5, 10.5, 16.5, 12.5, red);  // y = x / 3 from (10, 10)
    const std::set<std::pair<int, int>> expected = {{10, 10}, {11, 10}, {12, 11}, {13, 11},
                                                    {14, 11}, {15, 12}, {16, 12}};
    std::set<std::pair<int, int>> got;
    for (int y = 0; y < 100; ++y)
        for (int x = 0; x < 200; ++x)
            if (px(x, y) == red.rgb())
                got.insert({x, y});
    EXPECT_EQ(got, expected);

    // A line far outside the picture costs nothing and draws nothing; one across it from
    // huge coordinates still draws its visible part.
    pic.clear();
    pic.line(-1e300, 50.5, -1e299, 60.5, red);
    EXPECT_EQ(count(red.rgb()), 0);
    pic.line(-1e12, 50.5, 1e12, 50.5, red);
    EXPECT_EQ(count(red.rgb()), 200);
}

// plot_trace draws its polyline in one pass; it must give exactly the pixels of the drawing
// done one line_to at a time, whatever the data.
TEST_F(TracePlotTest, PolylineGivesThePixelsOfSegmentBySegmentDrawing) {
    std::mt19937 rng(20240611);
    std::normal_distribution<double> noise(0.0, 0.4);
    const int n = 65536;
    std::vector<float> x(n);
    std::vector<double> y(n);
    for (int k = 0; k < n; ++k) {
        x[k] = static_cast<float>(k + 1);
        y[k] = 0.8 * std::sin(k * 0.0007) + noise(rng);
    }
    // A few wild values: far out of range, not a number, x going backwards and far away.
    y[100] = 1e300;
    y[101] = -1e300;
    y[5000] = std::numeric_limits<double>::quiet_NaN();
    y[5001] = std::numeric_limits<double>::infinity();
    x[7000] = 10.0f;
    x[7001] = 1e30f;
    x[7002] = -1e30f;

    for (QSize size : {QSize(200, 100), QSize(37, 211), QSize(800, 300)}) {
        pic.resize(size);
        plot_trace(pic, 0, 1, n, 2, x.data(), y.data(), n);
        const QImage fast = pic.image();

        // The same drawing done literally, one segment per sample.
        const double xl = 0 - 0.01 * n, xr = 0 + 1.01 * n, yt = 1 + 0.01 * 2, yb = 1 - 1.01 * 2;
        PictureBox ref;
        ref.resize(size);
        ref.set_scale(xl, yt, xr, yb);
        ref.clear();
        for (int k = 0; k < 8; ++k)
            ref.line(xl, yt - k * 2.0 / 8, xr, yt - k * 2.0 / 8, QColor(grey));
        for (int k = 0; k < 10; ++k)
            ref.line(xl + k * double(n) / 10, yt, xl + k * double(n) / 10, yb, QColor(grey));
        ref.set_current(x[0], clamp_value(y[0], yb, yt));
        for (int k = 0; k < n; ++k)
            ref.line_to(x[k], clamp_value(y[k], yb, yt));

        ASSERT_EQ(fast.size(), ref.image().size());
        EXPECT_TRUE(fast == ref.image()) << size.width() << "x" << size.height();
    }
}

TEST_F(TracePlotTest, PictureKeepsItsDrawingWhenItGrows) {
    std::vector<double> ys(100, 0.3);
    plot_trace(pic, 0, 1, 100, 2, xs.data(), ys.data(), 100);
    pic.resize(300, 150);
    pic.line(-1e300, 0, -1e300, 0, Qt::red);  // a drawing call (here of nothing) brings the new size
    EXPECT_EQ(pic.image().size(), QSize(300, 150));
    EXPECT_EQ(px(3, 35), fg());
    EXPECT_EQ(px(250, 120), bg());
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
};

TEST_F(TraceUpdateTest, FrequencyDataDrawsHalfThePoints) {
    MainFrm& main = window_with_block(1024);
    global::domain = 1;
    global::trace_channel[0] = 1;
    global::trace_range[0] = 1;
    global::trace_has_data[0] = global::flag_true;
    // Samples 0..511 at 0.5, the upper half at -0.5: only the lower half is drawn.
    for (int k = 0; k < 1024; ++k)
        global::trace1_data[k] = k < 512 ? 0.5 : -0.5;
    main.trace_update();

    const PictureBox& pic = *main.CRTpic[0];
    const QImage& img = pic.image();
    ASSERT_EQ(img.size(), QSize(324, 404));
    const QRgb fg = pic.foreground().rgb();
    // The x scale runs from -5.12 to 517.12: x = 1 lands in column 6.1/522.24 * 324 = 3.8,
    // x = 512 in 320.8; 0.5 at row (1.02 - 0.5) / 2.04 * 404 = 102.98, -0.5 at row 301.02.
    auto row_has_trace = [&](int y) {
        int n = 0;
        for (int x = 0; x < img.width(); ++x)
            n += img.pixel(x, y) == fg;
        return n;
    };
    EXPECT_EQ(img.pixel(3, 102), fg);
    EXPECT_EQ(img.pixel(320, 102), fg);
    EXPECT_EQ(row_has_trace(300) + row_has_trace(301) + row_has_trace(302), 0);
    // The vertical grid line k = 5 at -5.12 + 256: column 256 / 522.24 * 324 = 158.8.
    EXPECT_EQ(img.pixel(158, 200), grey);
    // An odd block: 1023 / 2 = 511.5 rounds to 512 points.
    global::num_points = 1023;
    global::trace1_data[511] = -0.5;
    main.trace_update();
    EXPECT_EQ(row_has_trace(300) + row_has_trace(301) + row_has_trace(302) > 0, true);
}

TEST_F(TraceUpdateTest, OnlySlotsWithDataAreDrawnAndAStaleDrawingIsNotShownUnderAnotherLabel) {
    MainFrm& main = window_with_block(256);
    global::trace_channel = {1, 2, 0, 0, 0};
    global::trace_range = {1, 1, 1, 1, 0};
    global::trace_has_data = {global::flag_true, global::flag_false, 0, 0, 0};
    for (int k = 0; k < 256; ++k)
        global::trace1_data[k] = 0.5;
    main.trace_update();
    auto drawn = [&](int i) {
        const QImage& img = main.CRTpic[i]->image();
        int n = 0;
        for (int y = 0; y < img.height(); ++y)
            for (int x = 0; x < img.width(); ++x)
                n += img.pixel(x, y) != main.CRTpic[i]->background().rgb();
        return n;
    };
    EXPECT_GT(drawn(0), 0);
    EXPECT_EQ(drawn(1), 0);  // a slot without data gets neither grid nor trace

    // Slot 0 keeps its drawing while it shows no new data...
    global::trace_has_data[0] = global::flag_false;
    main.trace_update();
    EXPECT_GT(drawn(0), 0);
    // ...but when slot 1 takes position 0, slot 0's old trace is not shown beside "Chan 2".
    global::trace_channel[0] = 0;
    main.trace_update();
    EXPECT_EQ(main.ChanLbl[0]->text(), "Chan 2");
    EXPECT_EQ(drawn(0), 0);
}

}  // namespace
