#include "display/PictureBox.h"

#include <QPainter>
#include <QPalette>
#include <algorithm>
#include <cmath>
#include <cstdlib>
#include <cstring>
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

    Pixel operator()(double x, double y) const {
        if (!ok)
            return {0, 0, false};
        const double dx = (x - x1) / (x2 - x1) * w;
        const double dy = (y - y1) / (y2 - y1) * h;
        if (!std::isfinite(dx) || !std::isfinite(dy))
            return {0, 0, false};
        return {snap(dx, w), snap(dy, h), true};
    }
};

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

void PictureBox::column_run(int32_t x, int32_t y0, int32_t y1, QRgb color) {
    const int w = image_.width(), h = image_.height();
    if (x < 0 || x >= w)
        return;
    if (y0 > y1)
        std::swap(y0, y1);
    y0 = std::max(y0, 0);
    y1 = std::min(y1, h - 1);
    uchar* bits = image_.bits();
    const qsizetype stride = image_.bytesPerLine();
    for (qsizetype y = y0; y <= y1; ++y)
        reinterpret_cast<QRgb*>(bits + y * stride)[x] = color;
}

// All octants, stepping from a to b.
void PictureBox::segment(int32_t ax, int32_t ay, int32_t bx, int32_t by, QRgb color) {
    Pixel a{ax, ay, true}, b{bx, by, true};
    const int w = image_.width(), h = image_.height();
    const int64_t far = far_bound(w, h);
    auto outside = [&](const Pixel& p) { return p.x < -far || p.x > w + far || p.y < -far || p.y > h + far; };
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
    uchar* bits = image_.bits();
    const qsizetype stride = image_.bytesPerLine();
    const int64_t dx = std::llabs(int64_t{b.x} - a.x), dy = -std::llabs(int64_t{b.y} - a.y);
    const int sx = a.x < b.x ? 1 : -1, sy = a.y < b.y ? 1 : -1;
    int64_t err = dx + dy, x = a.x, y = a.y;
    for (;;) {
        if (x >= 0 && x < w && y >= 0 && y < h)
            reinterpret_cast<QRgb*>(bits + y * stride)[x] = color;
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

void PictureBox::line(double x1, double y1, double x2, double y2, const QColor& color) {
    ensure_image();
    const Mapping map{sx1_, sy1_, sx2_, sy2_, image_.width(), image_.height(), scale_ok_};
    const Pixel a = map(x1, y1), b = map(x2, y2);
    if (a.ok && b.ok)
        segment(a.x, a.y, b.x, b.y, color.rgb());
    cur_x_ = x2;
    cur_y_ = y2;
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
    ensure_image();
    const QRgb color = foreground().rgb();
    const int h = image_.height();
    const int64_t far = far_bound(image_.width(), h);
    const Mapping map{sx1_, sy1_, sx2_, sy2_, image_.width(), h, scale_ok_};
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
                column_run(prev.x, lo, hi, color);
            chain = false;
            if (prev.ok && p.ok)
                segment(prev.x, prev.y, p.x, p.y, color);
            lo = hi = p.y;
        }
        prev = p;
        prev_chainable = p_chainable;
    }
    if (chain)
        column_run(prev.x, lo, hi, color);
    cur_x_ = points[n - 1].x();
    cur_y_ = points[n - 1].y();
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
