// Every window at sizes from 1 x 1 pixel to 30000 x 30000 pixels, with extreme aspect ratios,
// and the main window drawing four traces at each: no crash, no overflow (the suite runs under
// the sanitizers too), every control placed within reach of its window, and the traces still
// drawn where the window has room for them.
#include <gtest/gtest.h>

#include <sys/resource.h>

#include <QGroupBox>
#include <QTest>
#include <cstdio>
#include <functional>
#include <string>
#include <vector>

#include "core/GreetFrm.h"
#include "core/global.h"
#include "core/windows.h"
#include "display/MainFrm.h"
#include "pages/DispFrm.h"
#include "pages/InputFrm.h"
#include "pages/MeasFrm.h"
#include "pages/SrcFrm.h"
#include "pages/VxiFrm.h"
#include "panel_fixture.h"

namespace {

struct Size {
    int w, h;
};

// From a single pixel to far beyond any screen, with strips one pixel thin both ways; the sweep
// ends at an ordinary size, since a window keeps the backing store of its largest showing
// (3.6 GB at 30000 x 30000) until it is shown smaller.
const std::vector<Size> sizes = {{1, 1},       {2, 3},         {1, 30000},     {30000, 1},   {7, 4000},
                                 {4000, 7},    {120, 90},      {1920, 1080},   {3840, 2160}, {200, 12000},
                                 {12000, 200}, {16384, 16384}, {30000, 30000}, {640, 480}};

// Peak resident memory of the process so far, in MB.
long peak_mb() {
    rusage usage{};
    getrusage(RUSAGE_SELF, &usage);
    return usage.ru_maxrss / 1024;
}

class WindowSizesTest : public PanelTest {
  protected:
    void SetUp() override {
        PanelTest::SetUp();
        main().Form_Load();
    }

    MainFrm& main() { return forms::get<MainFrm>(); }

    // Resizes a shown window as a user would, and checks where its controls went: a layout
    // that overflowed, or saturated a twip value, puts a control millions of pixels away.
    static void resize_and_check(Form& window, Size s, const char* name) {
        SCOPED_TRACE(std::string(name) + " at " + std::to_string(s.w) + " x " + std::to_string(s.h));
        window.resize(s.w, s.h);
        window.run_resize();
        QCoreApplication::processEvents();
        EXPECT_GE(window.width(), 1);
        EXPECT_GE(window.height(), 1);
        const int reach = 2 * std::max({window.width(), window.height(), 2000});
        for (const QWidget* child : window.findChildren<QWidget*>()) {
            // The controls: the window's own and those in its frames, not a control's insides.
            const QWidget* parent = child->parentWidget();
            if (child->isWindow() || (parent != &window && !qobject_cast<const QGroupBox*>(parent)))
                continue;
            const QRect g = child->geometry();
            EXPECT_LE(std::abs(g.x()), reach) << child->metaObject()->className();
            EXPECT_LE(std::abs(g.y()), reach) << child->metaObject()->className();
            EXPECT_LE(g.width(), reach) << child->metaObject()->className();
            EXPECT_LE(g.height(), reach) << child->metaObject()->className();
        }
    }

    // Opens a page in the main window's place, as its button does, runs it through every size
    // and hands the place back.
    void sweep_page(Form& page, const char* name) {
        switch_page(main(), page);
        for (const Size s : sizes)
            resize_and_check(page, s, name);
        switch_page(page, main());
    }
};

TEST_F(WindowSizesTest, EveryPageAndTheSplashTakeEverySize) {
    sweep_page(forms::get<GreetFrm>(), "GreetFrm");
    sweep_page(forms::get<DispFrm>(), "DispFrm");
    MeasFrm& meas = forms::get<MeasFrm>();
    meas.load_Meas_Form();
    sweep_page(meas, "MeasFrm");
    sweep_page(forms::get<InputFrm>(), "InputFrm");
    sweep_page(forms::get<SrcFrm>(), "SrcFrm");
    sweep_page(forms::get<VxiFrm>(), "VxiFrm");
    // No resize handler left a message behind (the pages read the module on each layout).
    EXPECT_TRUE(messages.empty());
}

TEST_F(WindowSizesTest, MainWindowDrawsFourTracesAtEverySize) {
    // Four traces holding a block of real data from a single-block run on the virtual clock.
    sim::use_virtual_clock();
    global::trace_channel = {1, 2, 3, 4, 0};
    main().trace_update();
    QTest::mouseClick(main().GoBtn, Qt::LeftButton);
    for (int n = 0; n < 10 && global::running == global::flag_true; ++n) {
        sim::advance_clock(0.05);
        main().MainTimer_Timer();
    }
    for (int t = 0; t < 4; ++t)
        ASSERT_EQ(global::trace_has_data[t], global::flag_true) << t;

    for (const Size s : sizes) {
        resize_and_check(main(), s, "MainFrm");
        SCOPED_TRACE(std::to_string(s.w) + " x " + std::to_string(s.h));
        // The window keeps its minimum of 3000 x 3000 twips (200 pixels at 96 DPI).
        EXPECT_GE(main().Width(), 3000.0);
        EXPECT_GE(main().Height(), 3000.0);
        EXPECT_GT(global::trace_area_width, 0);
        EXPECT_GT(global::trace_area_height, 0);
        EXPECT_NEAR(global::trace_area_width, main().ScaleWidth() * 0.7, 1.0);
        main().trace_update();
        QCoreApplication::processEvents();
        // Each picture holds an image of its own size with the trace drawn across it: its
        // middle column carries a pixel in the trace colour.
        for (int pos = 0; pos < 4; ++pos) {
            const PictureBox* pic = main().CRTpic[pos];
            ASSERT_FALSE(pic->isHidden()) << pos;
            const QImage& image = pic->image();
            ASSERT_FALSE(image.isNull()) << pos;
            EXPECT_EQ(image.width(), qRound(pic->width() * image.devicePixelRatio())) << pos;
            EXPECT_EQ(image.height(), qRound(pic->height() * image.devicePixelRatio())) << pos;
            const QRgb trace = pic->foreground().rgb();
            const int x = image.width() / 2;
            bool drawn = false;
            for (int y = 0; y < image.height() && !drawn; ++y)
                drawn = image.pixel(x, y) == trace;
            EXPECT_TRUE(drawn) << pos;
        }
    }
    std::printf("[ window sizes ] %zu sizes from 1 x 1 to 30000 x 30000 pixels; peak RSS %ld MB\n",
                sizes.size(), peak_mb());
    EXPECT_TRUE(messages.empty());
}

}  // namespace
