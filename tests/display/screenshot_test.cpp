// Pictures of the main window with one and with four traces, for looking at, and the time a
// full redraw of four 65536-point traces takes. Runs only when K7720_SCREENSHOT_DIR names a
// folder for the pictures.
#include <gtest/gtest.h>

#include <QElapsedTimer>
#include <QPainter>
#include <QPixmap>
#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <random>

#include "core/global.h"
#include "core/windows.h"
#include "display/MainFrm.h"
#include "display/trace_plot.h"
#include "panel_fixture.h"

namespace {

// Four recognisable blocks: a sine, a sine with its third harmonic, a square wave that runs
// past its scale, and a decaying burst of noise.
void fill_blocks(int points) {
    std::mt19937 rng(7720);
    std::normal_distribution<double> noise(0.0, 1.0);
    global::num_points = points;
    global::x_values.assign(points + 1, 0.0f);
    for (int t = 0; t < 4; ++t)
        global::trace_data(t).assign(points + 1, 0.0);
    const double two_pi = 6.283185307179586;
    for (int k = 0; k < points; ++k) {
        const double ph = two_pi * k * 4.0 / points;
        global::x_values[k] = static_cast<float>(k + 1);
        global::trace1_data[k] = 0.8 * std::sin(ph) + 0.02 * noise(rng);
        global::trace2_data[k] = 6.0 * std::sin(ph) + 2.5 * std::sin(3 * ph);
        global::trace3_data[k] = std::sin(ph * 2) >= 0 ? 2.5 : -2.5;
        global::trace4_data[k] = 4.0 * std::exp(-5.0 * k / points) * noise(rng);
    }
    global::trace_range = {1, 10, 2, 5, 0};
    for (int t = 0; t < 4; ++t)
        global::trace_has_data[t] = global::flag_true;
}

class ScreenshotTest : public PanelTest {};

TEST_F(ScreenshotTest, MainWindowWithOneAndFourTraces) {
    const char* dir = std::getenv("K7720_SCREENSHOT_DIR");
    if (dir == nullptr)
        GTEST_SKIP() << "K7720_SCREENSHOT_DIR not set";
    MainFrm& main = forms::get<MainFrm>();
    const QString tag = QStringLiteral("_x%1").arg(main.devicePixelRatioF());
    main.show();

    fill_blocks(1024);
    global::trace_channel = {1, 0, 0, 0, 0};
    main.resize(463, 578);
    main.run_resize();
    EXPECT_TRUE(main.grab().save(QStringLiteral("%1/main_one%2.png").arg(dir, tag)));

    global::trace_channel = {1, 2, 3, 4, 0};
    global::trigger_source = 1;
    main.resize(900, 700);
    main.run_resize();
    EXPECT_TRUE(main.grab().save(QStringLiteral("%1/main_four%2.png").arg(dir, tag)));
    EXPECT_EQ(main.CRTpic[0]->image().width(), qRound(main.CRTpic[0]->width() * main.devicePixelRatioF()));

    // A full redraw of four 65536-point traces: plot_trace, then the same drawing one line_to
    // per sample, then one painter line per sample.
    fill_blocks(65536);
    QElapsedTimer clock;
    clock.start();
    main.trace_update();
    const double fast_ms = clock.nsecsElapsed() / 1e6;
    EXPECT_TRUE(main.grab().save(QStringLiteral("%1/main_four_65536%2.png").arg(dir, tag)));

    clock.restart();
    for (int t = 0; t < 4; ++t) {
        PictureBox& pic = *main.CRTpic[t];
        const double h = global::trace_high[t] - global::trace_low[t];
        const double yt = global::trace_high[t] + 0.01 * h, yb = global::trace_high[t] - 1.01 * h;
        pic.set_scale(-0.01 * 65536, yt, 1.01 * 65536, yb);
        pic.clear();
        const auto& ys = global::trace_data(t);
        pic.set_current(global::x_values[0], clamp_value(ys[0], yb, yt));
        for (int k = 0; k < 65536; ++k)
            pic.line_to(global::x_values[k], clamp_value(ys[k], yb, yt));
    }
    const double segment_ms = clock.nsecsElapsed() / 1e6;

    clock.restart();
    for (int t = 0; t < 4; ++t) {
        PictureBox& pic = *main.CRTpic[t];
        QImage img(pic.image().size(), QImage::Format_RGB32);
        const auto& ys = global::trace_data(t);
        for (int k = 1; k < 65536; ++k) {
            QPainter p(&img);
            p.setPen(Qt::green);
            p.drawLine(QPointF(pic.device_x(global::x_values[k - 1]), pic.device_y(ys[k - 1])),
                       QPointF(pic.device_x(global::x_values[k]), pic.device_y(ys[k])));
        }
    }
    const double painter_ms = clock.nsecsElapsed() / 1e6;
    std::printf(
        "four traces of 65536 points: plot_trace %.2f ms, line_to per sample %.2f ms, "
        "one painter per line %.2f ms\n",
        fast_ms, segment_ms, painter_ms);
}

}  // namespace
