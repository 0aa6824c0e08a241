#include "display/PictureBox.h"

#include <QPainter>
#include <QPalette>
#include <algorithm>
#include <cmath>
#include <cstdlib>
#include <cstring>
#include <limits>
#include <vector>

namespace {

// Device coordinates further than this from the picture are clipped before rasterising, so a
// wild value costs no more than a line across a few picture widths.
int64_t far_bound(int w, int h) {
    return 4 * (static_cast<int64_t>(w) + h) + 64;
}

// One finite device coordinate to the pixel that contains it; the far edge (offset == size)
// belongs to the last pixel. Saturated at a billion pixels, far beyond any clipping bound.
inline int32_t snap(double offset, int size) {
    if (offset == size)
        return size - 1;
    constexpr double limit = 1e9;
    offset = std::clamp(offset, -limit, limit);
    const auto whole = static_cast<int32_t>(offset);  // toward zero; one down for negatives
    return whole > offset ? whole - 1 : whole;
}

struct Pixel {
    int32_t x, y;
    bool ok;  // false for a point with no device position (not finite, or no valid scale)
};

// User coordinates to device pixels: a point lands at offset (x - x1) / (x2 - x1) * width
// from the left edge and (y - y1) / (y2 - y1) * height from the top edge. Every drawing call
// maps through this one function, so the same point always gives the same pixel.
struct Mapping {
    double x1, y1, x2, y2;
    int w, h;
    bool ok;

    double offset_x(double x) const { return (x - x1) / (x2 - x1) * w; }
    double offset_y(double y) const { return (y - y1) / (y2 - y1) * h; }

    Pixel operator()(double x, double y) const {
        if (!ok)
            return {0, 0, false};
        const double dx = offset_x(x);
        const double dy = offset_y(y);
        if (!std::isfinite(dx) || !std::isfinite(dy))
            return {0, 0, false};
        return {snap(dx, w), snap(dy, h), true};
    }
};

// Where the pixel columns begin along x, for a scale that grows to the right. Every step of
// the mapping (subtract, divide, multiply, round down) never decreases as x grows, so the
// column of x never does either: with edges[c] the smallest x in column c or beyond, every x in
// [edges[c], edges[c + 1]) lies in column c, and a sample is placed in its column by two
// comparisons instead of a division. Each edge starts where the scale's arithmetic puts it and
// is moved a few units in the last place to the exact one; an edge further off than that is
// NaN, and its columns then take the exact path for every sample.
void column_edges(const Mapping& map, std::vector<double>& edges) {
    constexpr int max_steps = 16;
    constexpr double inf = std::numeric_limits<double>::infinity();
    auto reaches = [&map](double x, int32_t c) {
        const double offset = map.offset_x(x);
        return std::isfinite(offset) && snap(offset, map.w) >= c;
    };
    edges.resize(static_cast<size_t>(map.w) + 1);
    for (int32_t c = 0; c <= map.w; ++c) {
        double x = map.x1 + (map.x2 - map.x1) * (static_cast<double>(c) / map.w);
        double edge = std::numeric_limits<double>::quiet_NaN();
        if (!std::isfinite(x)) {
        } else if (reaches(x, c)) {
            for (int i = 0; i < max_steps; ++i) {
                const double below = std::nextafter(x, -inf);
                if (!reaches(below, c)) {
                    edge = x;
                    break;
                }
                x = below;
            }
        } else {
            for (int i = 0; i < max_steps; ++i) {
                x = std::nextafter(x, inf);
                if (reaches(x, c)) {
                    edge = x;
                    break;
                }
            }
        }
        edges[static_cast<size_t>(c)] = edge;
    }
}

// Two doubles in one register: the quick pass over a column looks at the samples in pairs.
using Pair = double __attribute__((vector_size(16)));
using PairMask = int64_t __attribute__((vector_size(16)));
using FloatPair = float __attribute__((vector_size(8)));

inline Pair load_pair(const double* p) {
    Pair v;
    std::memcpy(&v, p, sizeof v);
    return v;
}

inline Pair load_pair(const float* p) {
    FloatPair v;
    std::memcpy(&v, p, sizeof v);
    return __builtin_convertvector(v, Pair);
}

// Liang-Barsky clip of a segment to [lo_x, hi_x] x [lo_y, hi_y]; false when nothing is left.
bool clip(double& x0, double& y0, double& x1, double& y1, double lo_x, double lo_y, double hi_x,
          double hi_y) {
    double t0 = 0.0, t1 = 1.0;
    const double dx = x1 - x0, dy = y1 - y0;
    const double p[4] = {-dx, dx, -dy, dy};
    const double q[4] = {x0 - lo_x, hi_x - x0, y0 - lo_y, hi_y - y0};
    for (int i = 0; i < 4; ++i) {
        if (p[i] == 0.0) {
            if (q[i] < 0.0)
                return false;
            continue;
        }
        const double r = q[i] / p[i];
        if (p[i] < 0.0) {
            if (r > t1)
                return false;
            t0 = std::max(t0, r);
        } else {
            if (r < t0)
                return false;
            t1 = std::min(t1, r);
        }
    }
    const double nx0 = x0 + t0 * dx, ny0 = y0 + t0 * dy;
    x1 = x0 + t1 * dx;
    y1 = y0 + t1 * dy;
    x0 = nx0;
    y0 = ny0;
    return true;
}

}  // namespace

PictureBox::PictureBox(QWidget* parent) : QWidget(parent) {
    setAttribute(Qt::WA_OpaquePaintEvent);
}

void PictureBox::set_scale(double x1, double y1, double x2, double y2) {
    sx1_ = x1;
    sy1_ = y1;
    sx2_ = x2;
    sy2_ = y2;
    const double spx = x2 - x1, spy = y2 - y1;
    scale_ok_ = std::isfinite(x1) && std::isfinite(y1) && std::isfinite(spx) && std::isfinite(spy) &&
                spx != 0.0 && spy != 0.0;
}

QColor PictureBox::background() const {
    return palette().color(QPalette::Base);
}
QColor PictureBox::foreground() const {
    return palette().color(QPalette::Text);
}

void PictureBox::ensure_image() {
    const qreal dpr = devicePixelRatioF();
    const QSize want(std::max(1, qRound(width() * dpr)), std::max(1, qRound(height() * dpr)));
    if (image_.size() == want && image_.devicePixelRatio() == dpr)
        return;
    QImage next(want, QImage::Format_RGB32);
    next.setDevicePixelRatio(dpr);
    next.fill(background());
    // A picture that changes size keeps what was drawn, anchored at its upper-left corner.
    if (!image_.isNull() && image_.devicePixelRatio() == dpr) {
        const int rows = std::min(next.height(), image_.height());
        const size_t bytes = sizeof(QRgb) * static_cast<size_t>(std::min(next.width(), image_.width()));
        for (int y = 0; y < rows; ++y)
            std::memcpy(next.scanLine(y), image_.constScanLine(y), bytes);
    }
    image_ = std::move(next);
}

void PictureBox::clear() {
    ensure_image();
    image_.fill(background());
    update();
}

double PictureBox::device_x(double x) const {
    const qreal dpr = devicePixelRatioF();
    const int w = image_.isNull() ? std::max(1, qRound(width() * dpr)) : image_.width();
    return (x - sx1_) / (sx2_ - sx1_) * w;
}

double PictureBox::device_y(double y) const {
    const qreal dpr = devicePixelRatioF();
    const int h = image_.isNull() ? std::max(1, qRound(height() * dpr)) : image_.height();
    return (y - sy1_) / (sy2_ - sy1_) * h;
}

// The image's pixels for one drawing call: fetched once, so that the runs and segments of a
// long block do not go back to the image for every pixel.
struct PictureBox::Canvas {
    uchar* bits;
    qsizetype stride;  // bytes per row
    int w, h;

    QRgb* row_at(qsizetype y) const { return reinterpret_cast<QRgb*>(bits + y * stride); }

    // The pixels of column x from row y0 to row y1, both included, those inside the picture.
    void column_run(int32_t x, int32_t y0, int32_t y1, QRgb color) const {
        if (x < 0 || x >= w)
            return;
        if (y0 > y1)
            std::swap(y0, y1);
        y0 = std::max(y0, 0);
        y1 = std::min(y1, h - 1);
        for (qsizetype y = y0; y <= y1; ++y)
            row_at(y)[x] = color;
    }

    // The same along row y.
    void row_run(int32_t y, int32_t x0, int32_t x1, QRgb color) const {
        if (y < 0 || y >= h)
            return;
        if (x0 > x1)
            std::swap(x0, x1);
        x0 = std::max(x0, 0);
        x1 = std::min(x1, w - 1);
        if (x0 <= x1)
            std::fill(row_at(y) + x0, row_at(y) + x1 + 1, color);
    }

    // Integer line between two device pixels, both ends included, stepping from a to b.
    void segment(int32_t ax, int32_t ay, int32_t bx, int32_t by, QRgb color) const {
        Pixel a{ax, ay, true}, b{bx, by, true};
        const int64_t far = far_bound(w, h);
        auto outside = [&](const Pixel& p) {
            return p.x < -far || p.x > w + far || p.y < -far || p.y > h + far;
        };
        if (outside(a) || outside(b)) {
            double x0 = static_cast<double>(a.x), y0 = static_cast<double>(a.y);
            double x1 = static_cast<double>(b.x), y1 = static_cast<double>(b.y);
            if (!clip(x0, y0, x1, y1, -2.0, -2.0, w + 1.0, h + 1.0))
                return;
            a = {static_cast<int32_t>(std::lround(x0)), static_cast<int32_t>(std::lround(y0)), true};
            b = {static_cast<int32_t>(std::lround(x1)), static_cast<int32_t>(std::lround(y1)), true};
        }
        if (a.x == b.x) {
            column_run(a.x, a.y, b.y, color);
            return;
        }
        if (a.y == b.y) {
            row_run(a.y, a.x, b.x, color);
            return;
        }
        // One column apart, as neighbouring samples of a long block mostly are: the steps below
        // take the rows r = 0, 1, ... counted from a while 2 r < |dy| in a's column and the rest
        // in b's, so the line is two runs.
        if (b.x - a.x == 1 || a.x - b.x == 1) {
            const int64_t d = std::llabs(int64_t{b.y} - a.y);
            const int64_t sy = a.y < b.y ? 1 : -1;
            const int64_t last_in_a = a.y + (d - 1) / 2 * sy;
            column_run(a.x, a.y, static_cast<int32_t>(last_in_a), color);
            column_run(b.x, static_cast<int32_t>(last_in_a + sy), b.y, color);
            return;
        }
        const int64_t dx = std::llabs(int64_t{b.x} - a.x), dy = -std::llabs(int64_t{b.y} - a.y);
        const int sx = a.x < b.x ? 1 : -1, sy = a.y < b.y ? 1 : -1;
        int64_t err = dx + dy, x = a.x, y = a.y;
        for (;;) {
            if (x >= 0 && x < w && y >= 0 && y < h)
                row_at(y)[x] = color;
            if (x == b.x && y == b.y)
                break;
            const int64_t e2 = 2 * err;
            if (e2 >= dy) {
                err += dy;
                x += sx;
            }
            if (e2 <= dx) {
                err += dx;
                y += sy;
            }
        }
    }
};

PictureBox::Canvas PictureBox::canvas() {
    ensure_image();
    return {image_.bits(), image_.bytesPerLine(), image_.width(), image_.height()};
}

void PictureBox::line(double x1, double y1, double x2, double y2, const QColor& color) {
    const Canvas c = canvas();
    const Mapping map{sx1_, sy1_, sx2_, sy2_, c.w, c.h, scale_ok_};
    const Pixel a = map(x1, y1), b = map(x2, y2);
    if (a.ok && b.ok)
        c.segment(a.x, a.y, b.x, b.y, color.rgb());
    cur_x_ = x2;
    cur_y_ = y2;
    update();
}

void PictureBox::lines(const QLineF* list, int n, const QColor& color) {
    if (n <= 0)
        return;
    const Canvas c = canvas();
    const Mapping map{sx1_, sy1_, sx2_, sy2_, c.w, c.h, scale_ok_};
    const QRgb rgb = color.rgb();
    for (int i = 0; i < n; ++i) {
        const Pixel a = map(list[i].x1(), list[i].y1()), b = map(list[i].x2(), list[i].y2());
        if (a.ok && b.ok)
            c.segment(a.x, a.y, b.x, b.y, rgb);
    }
    cur_x_ = list[n - 1].x2();
    cur_y_ = list[n - 1].y2();
    update();
}

void PictureBox::line_to(double x, double y) {
    line(cur_x_, cur_y_, x, y, foreground());
}

void PictureBox::set_current(double x, double y) {
    cur_x_ = x;
    cur_y_ = y;
}

void PictureBox::polyline_to(const QPointF* points, int n) {
    if (n <= 0)
        return;
    const Canvas c = canvas();
    const QRgb color = foreground().rgb();
    const int h = c.h;
    const int64_t far = far_bound(c.w, h);
    const Mapping map{sx1_, sy1_, sx2_, sy2_, c.w, h, scale_ok_};
    // Points with a position not far above or below may join a column chain.
    auto chainable = [&](const Pixel& p) { return p.ok && p.y >= -far && p.y <= h + far; };

    // Consecutive points in one pixel column form a chain of vertical segments whose pixels
    // are exactly the rows from the chain's lowest to its highest point: drawn as one run.
    // Every other segment is drawn as line() draws it.
    Pixel prev = map(cur_x_, cur_y_);
    bool prev_chainable = chainable(prev);
    bool chain = false;
    int32_t lo = prev.y, hi = prev.y;
    for (int k = 0; k < n; ++k) {
        const Pixel p = map(points[k].x(), points[k].y());
        const bool p_chainable = chainable(p);
        if (p_chainable && prev_chainable && p.x == prev.x) {
            lo = std::min(lo, p.y);
            hi = std::max(hi, p.y);
            chain = true;
        } else {
            if (chain)
                c.column_run(prev.x, lo, hi, color);
            chain = false;
            if (prev.ok && p.ok)
                c.segment(prev.x, prev.y, p.x, p.y, color);
            lo = hi = p.y;
        }
        prev = p;
        prev_chainable = p_chainable;
    }
    if (chain)
        c.column_run(prev.x, lo, hi, color);
    cur_x_ = points[n - 1].x();
    cur_y_ = points[n - 1].y();
    update();
}

void PictureBox::trace_to(const float* xs, const double* ys, int n, double low, double high) {
    if (n <= 0)
        return;
    const Canvas c = canvas();
    const int w = c.w, h = c.h;
    const int64_t far = far_bound(w, h);
    const Mapping map{sx1_, sy1_, sx2_, sy2_, w, h, scale_ok_};
    auto chainable = [&](const Pixel& p) { return p.ok && p.y >= -far && p.y <= h + far; };
    auto clamp = [low, high](double v) {
        if (v < low)
            v = low;
        if (v > high)
            v = high;
        return v;
    };

    // The quick way needs a scale that grows to the right and a clamp range whose every finite
    // value may join a column chain (rows follow y monotonically, so its two ends decide).
    if (!(sx2_ > sx1_) || !(low <= high) || !chainable(map(sx1_, low)) || !chainable(map(sx1_, high))) {
        static thread_local std::vector<QPointF> points;
        points.resize(static_cast<size_t>(n));
        for (int k = 0; k < n; ++k)
            points[k] = QPointF(xs[k], clamp(ys[k]));
        polyline_to(points.data(), n);
        return;
    }

    // As in polyline_to: consecutive chainable points in one column make a chain, drawn as the
    // run of rows between its lowest and highest point; every other step is a segment. A chain
    // is kept as its lowest and highest y, whose rows are the run's ends.
    const QRgb color = foreground().rgb();
    constexpr double inf = std::numeric_limits<double>::infinity();
    // The edges cost a few divisions per column; they pay only when columns hold several
    // samples. Without them every sample takes the exact path.
    if (n >= 2 * w)
        column_edges(map, column_edges_);
    else
        column_edges_.assign(static_cast<size_t>(w) + 1, std::numeric_limits<double>::quiet_NaN());
    // The x range [lo, hi) of column c; empty when the column is outside the picture or one of
    // its edges is unsettled.
    auto column_range = [&](int32_t c, double& lo, double& hi) {
        lo = inf;
        hi = -inf;
        if (c < 0 || c >= w)
            return;
        const double a = column_edges_[static_cast<size_t>(c)], b = column_edges_[static_cast<size_t>(c) + 1];
        if (!std::isnan(a) && !std::isnan(b)) {
            lo = a;
            hi = b;
        }
    };
    auto row = [&](double y) { return snap(map.offset_y(y), h); };

    Pixel prev = map(cur_x_, cur_y_);
    bool prev_chainable = chainable(prev);
    int32_t chain_x = prev.x;
    double chain_min = cur_y_, chain_max = cur_y_;
    bool chain = false;
    double in_lo = inf, in_hi = -inf;  // samples with x in [in_lo, in_hi) fall in column chain_x
    if (prev_chainable)
        column_range(prev.x, in_lo, in_hi);

    int k = 0;
    while (k < n) {
        // Samples that stay in the chain's column only widen it. Their raw extremes are kept
        // (clamping keeps order, so it can come after), two pairs at a time with extremes of
        // their own so that no sample waits for the one before.
        const int first = k;
        const Pair lo_edge = {in_lo, in_lo}, hi_edge = {in_hi, in_hi};
        Pair lo_a = {inf, inf}, lo_b = lo_a, hi_a = {-inf, -inf}, hi_b = hi_a;
        for (; k + 4 <= n; k += 4) {
            const Pair xa = load_pair(xs + k), xb = load_pair(xs + k + 2);
            const Pair ya = load_pair(ys + k), yb = load_pair(ys + k + 2);
            const PairMask in =
                (xa >= lo_edge) & (xa < hi_edge) & (ya == ya) & (xb >= lo_edge) & (xb < hi_edge) & (yb == yb);
            if (!(in[0] & in[1]))
                break;
            lo_a = ya < lo_a ? ya : lo_a;
            lo_b = yb < lo_b ? yb : lo_b;
            hi_a = ya > hi_a ? ya : hi_a;
            hi_b = yb > hi_b ? yb : hi_b;
        }
        double raw_lo = std::min(std::min(lo_a[0], lo_a[1]), std::min(lo_b[0], lo_b[1]));
        double raw_hi = std::max(std::max(hi_a[0], hi_a[1]), std::max(hi_b[0], hi_b[1]));
        for (; k < n; ++k) {
            const double x = xs[k], y = ys[k];
            if (!(x >= in_lo && x < in_hi) || y != y)
                break;
            raw_lo = std::min(raw_lo, y);
            raw_hi = std::max(raw_hi, y);
        }
        if (k > first) {
            chain_min = std::min(chain_min, clamp(raw_lo));
            chain_max = std::max(chain_max, clamp(raw_hi));
            chain = true;
            prev = map(xs[k - 1], clamp(ys[k - 1]));
        }
        if (k == n)
            break;

        // Any other sample goes the exact way.
        const double y = clamp(ys[k]);
        const Pixel p = map(xs[k], y);
        const bool p_chainable = chainable(p);
        if (p_chainable && prev_chainable && p.x == prev.x) {
            chain_min = std::min(chain_min, y);
            chain_max = std::max(chain_max, y);
            chain = true;
        } else {
            if (chain)
                c.column_run(chain_x, row(chain_min), row(chain_max), color);
            chain = false;
            if (prev.ok && p.ok)
                c.segment(prev.x, prev.y, p.x, p.y, color);
            chain_x = p.x;
            chain_min = chain_max = y;
            in_lo = inf;
            in_hi = -inf;
            if (p_chainable)
                column_range(p.x, in_lo, in_hi);
        }
        prev = p;
        prev_chainable = p_chainable;
        ++k;
    }
    if (chain)
        c.column_run(chain_x, row(chain_min), row(chain_max), color);
    cur_x_ = xs[n - 1];
    cur_y_ = clamp(ys[n - 1]);
    update();
}

void PictureBox::paintEvent(QPaintEvent*) {
    QPainter p(this);
    if (image_.isNull()) {
        p.fillRect(rect(), background());
        return;
    }
    const QSizeF shown = QSizeF(image_.size()) / image_.devicePixelRatio();
    if (shown.width() < width() || shown.height() < height())
        p.fillRect(rect(), background());
    p.drawImage(QPointF(0, 0), image_);
}

void PictureBox::resizeEvent(QResizeEvent* event) {
    QWidget::resizeEvent(event);
    ensure_image();
}
