// The picture box's quick paths against plain references: lines against a textbook integer
// line, trace_to against one line_to per sample, and no sample left out of a long block.
#include <gtest/gtest.h>

#include <QImage>
#include <cmath>
#include <cstdlib>
#include <limits>
#include <random>
#include <set>
#include <utility>
#include <vector>

#include "display/PictureBox.h"
#include "display/trace_plot.h"
#include "panel_fixture.h"

namespace {

using PixelSet = std::set<std::pair<int, int>>;

constexpr double inf = std::numeric_limits<double>::infinity();
constexpr double nan = std::numeric_limits<double>::quiet_NaN();

PixelSet pixels_of(const QImage& img, QRgb color) {
    PixelSet got;
    for (int y = 0; y < img.height(); ++y)
        for (int x = 0; x < img.width(); ++x)
            if (img.pixel(x, y) == color)
                got.insert({x, y});
    return got;
}

// The textbook all-octant integer line from (x0, y0) to (x1, y1), both ends included.
PixelSet textbook_line(int x0, int y0, int x1, int y1) {
    PixelSet out;
    const int dx = std::abs(x1 - x0), dy = -std::abs(y1 - y0);
    const int sx = x0 < x1 ? 1 : -1, sy = y0 < y1 ? 1 : -1;
    int err = dx + dy;
    while (true) {
        out.insert({x0, y0});
        if (x0 == x1 && y0 == y1)
            return out;
        const int e2 = 2 * err;
        if (e2 >= dy) {
            err += dy;
            x0 += sx;
        }
        if (e2 <= dx) {
            err += dx;
            y0 += sy;
        }
    }
}

class PictureBoxTest : public PanelTest {};

// Vertical, horizontal and one-column-apart lines take short cuts; every direction and length
// must still give the textbook pixels (a tie goes to the second column: from (0, 0) to (1, 2)
// the middle row lies in column 1).
TEST_F(PictureBoxTest, ShortCutLinesGiveTheTextbookPixels) {
    PictureBox pic;
    pic.resize(200, 300);
    const QColor red(255, 0, 0);
    pic.set_scale(0, 0, 200, 300);  // one unit per pixel, y downward
    pic.clear();
    pic.line(0.5, 0.5, 1.5, 2.5, red);
    EXPECT_EQ(pixels_of(pic.image(), red.rgb()), (PixelSet{{0, 0}, {1, 1}, {1, 2}}));

    for (int dx = -3; dx <= 3; ++dx)
        for (int dy = -60; dy <= 60; ++dy) {
            pic.clear();
            pic.line(100.5, 150.5, 100.5 + dx, 150.5 + dy, red);
            ASSERT_EQ(pixels_of(pic.image(), red.rgb()), textbook_line(100, 150, 100 + dx, 150 + dy))
                << dx << "," << dy;
        }
    // Long horizontal lines and ones partly outside keep only the pixels inside.
    pic.clear();
    pic.line(-50.5, 10.5, 400.5, 10.5, red);
    pic.line(199.5, -20.5, 198.5, 20.5, red);
    PixelSet want;
    for (int x = 0; x < 200; ++x)
        want.insert({x, 10});
    for (const auto& p : textbook_line(199, -21, 198, 20))
        if (p.second >= 0)
            want.insert(p);
    EXPECT_EQ(pixels_of(pic.image(), red.rgb()), want);
}

// trace_to against line_to one sample at a time, on data that tries every path: samples shared
// by a column, gaps (NaN) and infinities at every place within a group of four, x going back
// or far away, clamp ranges inside and beyond the picture, a scale running right to left, and
// blocks of every length from 1 to 9.
TEST_F(PictureBoxTest, TraceToGivesThePixelsOfOneLineToPerSample) {
    std::mt19937 rng(7720);
    std::normal_distribution<double> noise(0.0, 0.3);
    const int n = 20000;
    std::vector<float> xs(n);
    std::vector<double> ys(n);
    for (int k = 0; k < n; ++k) {
        xs[k] = static_cast<float>(k + 1);
        ys[k] = 0.6 * std::sin(k * 0.001) + noise(rng);
    }
    for (int j = 0; j < 8; ++j) {
        ys[1000 + 101 * j] = nan;
        ys[3000 + 101 * j] = inf;
        ys[5000 + 101 * j] = -inf;
        ys[7000 + 101 * j] = 1e300;
    }
    xs[9000] = std::numeric_limits<float>::quiet_NaN();
    xs[9500] = 5.0f;
    xs[9501] = 4.0f;
    xs[12000] = 1e30f;
    xs[12001] = -1e30f;
    for (int k = 15000; k < 15040; ++k)
        xs[k] = 15000.5f;  // many samples at one x

    struct Case {
        double x1, y1, x2, y2;  // scale corners
        double low, high;       // clamp range
        double start_x, start_y;
    };
    const double xl = -0.01 * n, xr = 1.01 * n;
    const std::vector<Case> cases = {
        {xl, 1.02, xr, -1.02, -1.02, 1.02, xs[0], 0.0},  // as plot_trace draws
        {xl, 1.02, xr, -1.02, -0.5, 0.5, xs[0], 0.0},    // clamped inside the picture
        {xl, 1.02, xr, -1.02, -1e6, 1e6, xs[0], 0.0},    // clamp range beyond the picture
        {xl, 1.02, xr, -1.02, -1.02, 1.02, -1e9, 50.0},  // start far outside
        {xl, 1.02, xr, -1.02, -1.02, 1.02, nan, 0.0},    // start with no position
        {xr, 1.02, xl, -1.02, -1.02, 1.02, xs[0], 0.0},  // x growing to the left
        {xl, -1.02, xr, 1.02, -1.02, 1.02, xs[0], 0.0},  // y growing downward
    };
    for (QSize size : {QSize(900, 150), QSize(37, 211)}) {
        PictureBox fast, ref;
        fast.resize(size);
        ref.resize(size);
        auto compare = [&](const Case& c, const float* x, const double* y, int count) {
            for (PictureBox* p : {&fast, &ref}) {
                p->set_scale(c.x1, c.y1, c.x2, c.y2);
                p->clear();
                p->set_current(c.start_x, c.start_y);
            }
            fast.trace_to(x, y, count, c.low, c.high);
            for (int k = 0; k < count; ++k)
                ref.line_to(x[k], clamp_value(y[k], c.low, c.high));
            return fast.image() == ref.image();
        };
        for (size_t i = 0; i < cases.size(); ++i)
            EXPECT_TRUE(compare(cases[i], xs.data(), ys.data(), n)) << "case " << i << " " << size.width();
        for (int count = 1; count <= 9; ++count)
            for (int from : {998, 1000, 1001, 1002, 1003})
                EXPECT_TRUE(compare(cases[0], xs.data() + from, ys.data() + from, count))
                    << count << " from " << from;
    }
}

// A block of 65536 flat samples with one spike: wherever the spike sits, its pixel is drawn.
// The picture is 900 x 150 with the scale of plot_trace (0, 1, n, 2): sample k (x = k + 1) lies
// in column floor((k + 1 + 655.36) / 66846.72 * 900), and 0.9 in row floor(0.12 / 2.04 * 150)
// = 8, while the flat samples at 0 lie in row 75.
TEST_F(PictureBoxTest, EverySampleOfALongBlockReachesThePicture) {
    const int n = 65536;
    std::vector<float> xs(n);
    for (int k = 0; k < n; ++k)
        xs[k] = static_cast<float>(k + 1);
    std::vector<double> ys(n, 0.0);
    PictureBox pic;
    pic.resize(900, 150);
    const QRgb fg = pic.foreground().rgb();
    for (int k : {0, 1, 2, 3, 4, 5, 6, 7, 30001, 30002, 30003, 30004, 40000, 65534, 65535}) {
        ys[k] = 0.9;
        plot_trace(pic, 0, 1, n, 2, xs.data(), ys.data(), n);
        const int column = static_cast<int>(std::floor((k + 1 + 655.36) / 66846.72 * 900));
        EXPECT_EQ(pic.image().pixel(column, 8), fg) << k;
        EXPECT_EQ(pic.image().pixel(column, 75), fg) << k;
        ys[k] = 0.0;
        plot_trace(pic, 0, 1, n, 2, xs.data(), ys.data(), n);
        EXPECT_NE(pic.image().pixel(column, 8), fg) << k;
    }
}

}  // namespace
