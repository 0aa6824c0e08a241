#include "display/trace_plot.h"

#include <QColor>
#include <QLineF>
#include <algorithm>
#include <array>
#include <cmath>

namespace {

const QColor grid_grey(128, 128, 128);

}  // namespace

double clamp_value(double value, double low, double high) {
    if (value < low)
        value = low;
    if (value > high)
        value = high;
    return value;
}

void plot_trace(PictureBox& picture, double x1, double y1, double w, double h, const float* xs,
                const double* ys, int32_t n) {
    const double xl = x1 - 0.01 * w;
    const double xr = x1 + 1.01 * w;
    const double yt = y1 + 0.01 * h;
    const double yb = y1 - 1.01 * h;
    picture.set_scale(xl, yt, xr, yb);
    picture.clear();
    if (!picture.scale_valid())
        return;

    std::array<QLineF, 18> grid;
    for (int k = 0; k < 8; ++k) {
        const double y = yt - k * h / 8;
        grid[k] = QLineF(xl, y, xr, y);
    }
    for (int k = 0; k < 10; ++k) {
        const double x = xl + k * w / 10;
        grid[8 + k] = QLineF(x, yt, x, yb);
    }
    picture.lines(grid.data(), static_cast<int>(grid.size()), grid_grey);
    if (n < 1 || xs == nullptr || ys == nullptr)
        return;

    // The visible range runs from yb up to yt; a scale set upside down (high below low) has
    // them the other way round, and its samples are kept inside it all the same.
    const double lo = std::min(yb, yt), hi = std::max(yb, yt);
    picture.set_current(xs[0], clamp_value(ys[0], lo, hi));
    picture.trace_to(xs, ys, n, lo, hi);
}

void plot_trace(PictureBox& picture, double x1, double y1, double w, double h, std::span<const float> xs,
                std::span<const double> ys, int32_t n) {
    const auto held = static_cast<int64_t>(std::min(xs.size(), ys.size()));
    n = static_cast<int32_t>(std::clamp<int64_t>(n, 0, held));
    plot_trace(picture, x1, y1, w, h, n > 0 ? xs.data() : nullptr, n > 0 ? ys.data() : nullptr, n);
}
