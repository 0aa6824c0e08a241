// Pictures of the main window with one and with four traces, for looking at. Runs only when
// K7720_SCREENSHOT_DIR names a folder for the pictures.
#include <cmath>
#include <cstdlib>
#include <random>

#include "display_test.h"

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
    for (int k = 0; k < points; ++k) {
        const double ph = 6.283185307179586 * k * 4.0 / points;
        global::x_values[k] = static_cast<float>(k + 1);
        global::trace1_data[k] = 0.8 * std::sin(ph) + 0.02 * noise(rng);
        global::trace2_data[k] = 6.0 * std::sin(ph) + 2.5 * std::sin(3 * ph);
        global::trace3_data[k] = std::sin(ph * 2) >= 0 ? 2.5 : -2.5;
        global::trace4_data[k] = 4.0 * std::exp(-5.0 * k / points) * noise(rng);
    }
    global::trace_range = {1, 10, 2, 5, 0};
    global::trace_has_data = {global::flag_true, global::flag_true, global::flag_true, global::flag_true, 0};
}

class ScreenshotTest : public PanelTest {};

TEST_F(ScreenshotTest, MainWindowWithOneAndFourTraces) {
    const char* dir = std::getenv("K7720_SCREENSHOT_DIR");
    if (dir == nullptr)
        GTEST_SKIP() << "K7720_SCREENSHOT_DIR not set";
    MainFrm& main = forms::get<MainFrm>();
    const QString tag = QStringLiteral("_x%1").arg(main.devicePixelRatioF());
    main.show();
    auto shoot = [&](const char* name, QSize size) {
        main.resize(size);
        main.run_resize();
        EXPECT_TRUE(main.grab().save(QStringLiteral("%1/%2%3.png").arg(dir, name, tag))) << name;
    };
    fill_blocks(1024);
    global::trace_channel = {1, 0, 0, 0, 0};
    shoot("main_one", {463, 578});
    global::trace_channel = {1, 2, 3, 4, 0};
    global::trigger_source = 1;
    shoot("main_four", {900, 700});
    fill_blocks(65536);
    shoot("main_four_65536", {900, 700});
}

}  // namespace
