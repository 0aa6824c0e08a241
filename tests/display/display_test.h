// What the display tests share: the panel fixture and the headers most of them use, geometry
// printed readably in failure messages, and pixel sets and counts.
#pragma once

#include <gtest/gtest.h>

#include <QImage>
#include <QRect>
#include <ostream>
#include <set>
#include <string>
#include <utility>
#include <vector>

#include "core/global.h"
#include "core/windows.h"
#include "display/MainFrm.h"
#include "display/PictureBox.h"
#include "display/trace_plot.h"
#include "panel_fixture.h"

inline void PrintTo(const QRect& r, std::ostream* os) {
    *os << "QRect(" << r.x() << ", " << r.y() << ", " << r.width() << ", " << r.height() << ")";
}
inline void PrintTo(const QPoint& p, std::ostream* os) {
    *os << "QPoint(" << p.x() << ", " << p.y() << ")";
}

using PixelSet = std::set<std::pair<int, int>>;

inline PixelSet pixels_of(const QImage& img, QRgb color) {
    PixelSet got;
    for (int y = 0; y < img.height(); ++y)
        for (int x = 0; x < img.width(); ++x)
            if (img.pixel(x, y) == color)
                got.insert({x, y});
    return got;
}

inline int count_pixels(const QImage& img, QRgb color) {
    return static_cast<int>(pixels_of(img, color).size());
}
