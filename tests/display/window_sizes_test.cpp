// Every window at sizes from 1 x 1 pixel to 30000 x 30000 pixels, with extreme aspect ratios,
// and the main window drawing four traces at each: no crash, no overflow (the suite runs under
// the sanitizers too), every control placed within reach of its window, and the traces still
// drawn where the window has room for them.
#include <sys/resource.h>

#include <QGroupBox>
#include <QTest>
#include <cstdio>

#include "core/GreetFrm.h"
#include "display_test.h"
#include "pages/DispFrm.h"
#include "pages/InputFrm.h"
#include "pages/MeasFrm.h"
#include "pages/SrcFrm.h"
#include "pages/VxiFrm.h"

namespace {

// From a single pixel to far beyond any screen, with strips one pixel thin both ways; the sweep
// ends at an ordinary size, since a window keeps the backing store of its largest showing
// (3.6 GB at 30000 x 30000) until it is shown smaller.
const QSize sizes[] = {{1, 1}, {1, 30000}, {30000, 1}, {7, 4000}, {3840, 2160}, {30000, 30000}, {640, 480}};

class WindowSizesTest : public PanelTest {
  protected:
    void SetUp() override {
        PanelTest::SetUp();
        main().Form_Load();
    }
    MainFrm& main() { return forms::get<MainFrm>(); }

    // Resizes a shown window as a user would, and checks where its controls went: a layout
    // that overflowed, or saturated a twip value, puts a control millions of pixels away.
    static void resize_and_check(Form& window, QSize s) {
        window.resize(s);
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
            EXPECT_LE(std::max({std::abs(g.x()), std::abs(g.y()), g.width(), g.height()}), reach)
                << child->metaObject()->className();
        }
    }
};

TEST_F(WindowSizesTest, EveryPageAndTheSplashTakeEverySize) {
    forms::get<MeasFrm>().load_Meas_Form();
    for (Form* page : std::initializer_list<Form*>{&forms::get<GreetFrm>(), &forms::get<DispFrm>(),
                                                   &forms::get<MeasFrm>(), &forms::get<InputFrm>(),
                                                   &forms::get<SrcFrm>(), &forms::get<VxiFrm>()}) {
        switch_page(main(), *page);  // in the main window's place, as its button opens it
        for (const QSize s : sizes) {
            SCOPED_TRACE(page->metaObject()->className() + (" at " + std::to_string(s.width())) + " x " +
                         std::to_string(s.height()));
            resize_and_check(*page, s);
        }
        switch_page(*page, main());
    }
    EXPECT_TRUE(messages.empty());  // the pages read the module on each layout
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

    for (const QSize s : sizes) {
        SCOPED_TRACE(std::to_string(s.width()) + " x " + std::to_string(s.height()));
        resize_and_check(main(), s);
        // The window keeps its minimum of 3000 x 3000 twips (200 pixels at 96 DPI).
        EXPECT_GE(main().Width(), 3000.0);
        EXPECT_GE(main().Height(), 3000.0);
        EXPECT_GT(global::trace_area_height, 0);
        EXPECT_NEAR(global::trace_area_width, main().ScaleWidth() * 0.7, 1.0);
        // Each picture holds an image of its own size with the trace drawn across it: its
        // middle column carries a pixel in the trace colour.
        for (const PictureBox* pic : main().CRTpic) {
            const QImage& image = pic->image();
            ASSERT_FALSE(pic->isHidden() || image.isNull());
            EXPECT_EQ(image.size(), pic->size() * image.devicePixelRatio());
            bool drawn = false;
            for (int y = 0; y < image.height() && !drawn; ++y)
                drawn = image.pixel(image.width() / 2, y) == pic->foreground().rgb();
            EXPECT_TRUE(drawn);
        }
    }
    rusage usage{};
    getrusage(RUSAGE_SELF, &usage);
    std::printf("[ window sizes ] %zu sizes from 1 x 1 to 30000 x 30000 pixels; peak RSS %ld MB\n",
                std::size(sizes), usage.ru_maxrss / 1024);
    EXPECT_TRUE(messages.empty());
}

}  // namespace
