// The picture box's quick paths against plain references: lines against a textbook integer
// line, trace_to and plot_trace against one line_to per sample, and no sample of a long block
// left out.
#include <cmath>
#include <cstdlib>
#include <limits>
#include <random>

#include "display_test.h"

namespace {

constexpr double nan = std::numeric_limits<double>::quiet_NaN();
constexpr double inf = std::numeric_limits<double>::infinity();

// The textbook all-octant integer line from (x0, y0) to (x1, y1), both ends included.
PixelSet textbook_line(int x0, int y0, int x1, int y1) {
    PixelSet out;
    const int dx = std::abs(x1 - x0), dy = -std::abs(y1 - y0);
    const int sx = x0 < x1 ? 1 : -1, sy = y0 < y1 ? 1 : -1;
    for (int err = dx + dy;;) {
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

// Vertical, horizontal and one-column-apart lines take short cuts; lines in every direction
// and of every length must still give the textbook pixels (a tie goes to the second column:
// from (0, 0) to (1, 2) the middle row lies in column 1).
TEST_F(PictureBoxTest, LinesGiveTheTextbookPixels) {
    PictureBox pic;
    pic.resize(130, 130);
    const QColor red(255, 0, 0);
    pic.set_scale(0, 0, 130, 130);  // one unit per pixel, y downward
    pic.clear();
    pic.line(0.5, 0.5, 1.5, 2.5, red);
    EXPECT_EQ(pixels_of(pic.image(), red.rgb()), (PixelSet{{0, 0}, {1, 1}, {1, 2}}));

    for (int a = -3; a <= 3; ++a)
        for (int b = -60; b <= 60; ++b)
            for (const auto& [dx, dy] : {std::pair(a, b), std::pair(b, a)}) {
                pic.clear();
                pic.line(65.5, 65.5, 65.5 + dx, 65.5 + dy, red);
                ASSERT_EQ(pixels_of(pic.image(), red.rgb()), textbook_line(65, 65, 65 + dx, 65 + dy))
                    << dx << "," << dy;
            }
    // Lines partly outside keep only the pixels inside; one far outside draws nothing, and one
    // across the picture from huge coordinates still draws its visible part.
    pic.clear();
    pic.line(-50.5, 10.5, 400.5, 10.5, red);
    pic.line(129.5, -20.5, 128.5, 20.5, red);
    pic.line(-1e300, 50.5, -1e299, 60.5, red);
    pic.line(-1e12, 50.5, 1e12, 50.5, red);
    PixelSet want;
    for (int x = 0; x < 130; ++x)
        want.insert({{x, 10}, {x, 50}});
    for (const auto& p : textbook_line(129, -21, 128, 20))
        if (p.second >= 0)
            want.insert(p);
    EXPECT_EQ(pixels_of(pic.image(), red.rgb()), want);
}

// The fast drawing against line_to one sample at a time, on a noisy sine (fixed seed) with
// values far out of range, gaps (NaN) and infinities at every place within a group of four, x
// going back, far away or missing, and many samples at one x: plot_trace as a whole (its grid
// against one line call per grid line), then trace_to with clamp ranges inside and beyond the
// picture, starts outside or without a position, scales running right to left or downward, and
// blocks of 1 to 9 samples starting at every place in a group of four.
TEST_F(PictureBoxTest, FastDrawingGivesThePixelsOfOneLineToPerSample) {
    const int n = 65536;
    std::vector<float> xs(n);
    std::vector<double> ys(n);
    std::mt19937 rng(7720);
    std::normal_distribution<double> noise(0.0, 0.4);
    for (int k = 0; k < n; ++k) {
        xs[k] = static_cast<float>(k + 1);
        ys[k] = 0.8 * std::sin(k * 0.0007) + noise(rng);
    }
    for (int j = 0; j < 8; ++j) {
        ys[1000 + 101 * j] = nan;
        ys[3000 + 101 * j] = inf;
        ys[5000 + 101 * j] = -inf;
        ys[7000 + 101 * j] = j % 2 ? 1e300 : -1e300;
    }
    xs[9000] = std::numeric_limits<float>::quiet_NaN();
    xs[9500] = 5.0f;
    xs[9501] = 4.0f;
    xs[12000] = 1e30f;
    xs[12001] = -1e30f;
    for (int k = 15000; k < 15040; ++k)
        xs[k] = 15000.5f;

    // The scale of plot_trace(0, 1, n, 2), computed as it computes it.
    const double xl = 0 - 0.01 * n, xr = 0 + 1.01 * n, yt = 1 + 0.01 * 2, yb = 1 - 1.01 * 2;
    struct Case {
        double x1, y1, x2, y2;  // scale corners
        double low, high;       // clamp range
        double start_x, start_y;
    } const cases[] = {
        {xl, yt, xr, yb, yb, yt, xs[0], 0.0},     // as plot_trace draws
        {xl, yt, xr, yb, -0.5, 0.5, xs[0], 0.0},  // clamped inside the picture
        {xl, yt, xr, yb, -1e6, 1e6, xs[0], 0.0},  // clamp range beyond the picture
        {xl, yt, xr, yb, yb, yt, -1e9, 50.0},     // start far outside
        {xl, yt, xr, yb, yb, yt, nan, 0.0},       // start with no position
        {xr, yt, xl, yb, yb, yt, xs[0], 0.0},     // x growing to the left
        {xl, yb, xr, yt, yb, yt, xs[0], 0.0},     // y growing downward
    };
    for (QSize size : {QSize(900, 150), QSize(37, 211), QSize(200, 100)}) {
        SCOPED_TRACE(std::to_string(size.width()) + " x " + std::to_string(size.height()));
        PictureBox fast, ref;
        fast.resize(size);
        ref.resize(size);
        auto draw_ref = [&](const Case& c, int from, int count) {
            ref.set_current(c.start_x, c.start_y);
            for (int k = from; k < from + count; ++k)
                ref.line_to(xs[k], clamp_value(ys[k], c.low, c.high));
        };
        plot_trace(fast, 0, 1, n, 2, xs.data(), ys.data(), n);
        ref.set_scale(xl, yt, xr, yb);
        ref.clear();
        for (int k = 0; k < 8; ++k)
            ref.line(xl, yt - k * 2.0 / 8, xr, yt - k * 2.0 / 8, QColor(128, 128, 128));
        for (int k = 0; k < 10; ++k)
            ref.line(xl + k * double(n) / 10, yt, xl + k * double(n) / 10, yb, QColor(128, 128, 128));
        draw_ref({xl, yt, xr, yb, yb, yt, xs[0], clamp_value(ys[0], yb, yt)}, 0, n);
        EXPECT_TRUE(fast.image() == ref.image()) << "plot_trace";

        auto same = [&](const Case& c, int from, int count) {
            for (PictureBox* p : {&fast, &ref}) {
                p->set_scale(c.x1, c.y1, c.x2, c.y2);
                p->clear();
            }
            fast.set_current(c.start_x, c.start_y);
            fast.trace_to(&xs[from], &ys[from], count, c.low, c.high);
            draw_ref(c, from, count);
            return fast.image() == ref.image();
        };
        for (size_t i = 0; i < std::size(cases); ++i)
            EXPECT_TRUE(same(cases[i], 0, n)) << "case " << i;
        for (int count = 1; count <= 9; ++count)
            for (int from : {998, 1000, 1001, 1002, 1003})
                EXPECT_TRUE(same(cases[0], from, count)) << count << " from " << from;
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
