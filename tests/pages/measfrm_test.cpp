// The Measurement Control page: what it shows, what OK takes and refuses, the repeat notice.
#include <gtest/gtest.h>

#include <QTest>
#include <cmath>

#include "core/global.h"
#include "core/windows.h"
#include "display/MainFrm.h"
#include "measure/measurement.h"
#include "page_readability.h"
#include "pages/MeasFrm.h"
#include "panel_fixture.h"

namespace {

class MeasFrmTest : public PanelTest {
  protected:
    void SetUp() override {
        PanelTest::SetUp();
        main().Form_Load();
    }

    MainFrm& main() { return forms::get<MainFrm>(); }

    // As the main window's Meas button does: reload, then take the main window's place.
    MeasFrm& open_page() {
        MeasFrm& page = forms::get<MeasFrm>();
        page.load_Meas_Form();
        switch_page(main(), page);
        return page;
    }

    static void type(QLineEdit* box, const char* text) {
        box->clear();
        QTest::keyClicks(box, QString::fromUtf8(text));
    }

    static void click(QAbstractButton* b) { QTest::mouseClick(b, Qt::LeftButton); }
};

TEST_F(MeasFrmTest, OpeningShowsTheStoredSettings) {
    MeasFrm& page = open_page();
    EXPECT_EQ(page.windowTitle().toStdString(), "Measurement Control");
    EXPECT_TRUE(page.SingleBtn->isChecked());
    EXPECT_TRUE(page.BlockBtn->isChecked());
    EXPECT_TRUE(page.AutoBtn->isChecked());
    EXPECT_TRUE(page.TimeBtn->isChecked());
    EXPECT_FALSE(page.mmcheck->isChecked());
    EXPECT_EQ(page.BlocksizeTxt->text().toStdString(), " 1024");
    EXPECT_EQ(page.SpanTxt->text().toStdString(), " 20000");

    using namespace global;
    single_block = flag_false;
    block_mode = flag_false;
    trigger_source = 3;
    domain = 1;
    multi_mainframe = 1;
    blocksize = 4096;
    span = 12800.5;
    page.load_Meas_Form();
    EXPECT_TRUE(page.RepeatBtn->isChecked());
    EXPECT_TRUE(page.ContBtn->isChecked());
    EXPECT_TRUE(page.SourceBtn->isChecked());
    EXPECT_TRUE(page.FreqBtn->isChecked());
    EXPECT_TRUE(page.mmcheck->isChecked());
    EXPECT_EQ(page.BlocksizeTxt->text().toStdString(), " 4096");
    EXPECT_EQ(page.SpanTxt->text().toStdString(), " 12800.5");

    // A value no button stands for leaves that frame as it was.
    trigger_source = 7;
    page.load_Meas_Form();
    EXPECT_TRUE(page.SourceBtn->isChecked());
}

TEST_F(MeasFrmTest, CaptionsAreExactlyTheDesignedOnes) {
    MeasFrm& page = open_page();
    auto caption = [](const QAbstractButton* b) { return b->text().toStdString(); };
    auto title = [](const QGroupBox* g) { return g->title().toStdString(); };
    EXPECT_EQ(caption(page.BlockBtn), "Block ");
    EXPECT_EQ(title(page.MeasFrame), "Meas ");
    EXPECT_EQ(caption(page.ContBtn), "Continous");
    EXPECT_EQ(caption(page.SingleBtn), "Single Block");
    EXPECT_EQ(caption(page.RepeatBtn), "Repeat");
    EXPECT_EQ(caption(page.mmcheck), "Multi Mainframe");
    EXPECT_EQ(title(page.DomFrm), "Domain");
    EXPECT_EQ(title(page.SpanFrame), "Freq Span");
    EXPECT_EQ(title(page.BlocksizeFrame), "Blocksize");
    EXPECT_EQ(title(page.TrigFrame), "Trigger");
    EXPECT_EQ(title(page.ModeFrame), "Mode");
    // Each frame is its own group of options.
    EXPECT_EQ(page.AutoBtn->parentWidget(), page.TrigFrame);
    EXPECT_EQ(page.TimeBtn->parentWidget(), page.DomFrm);
    EXPECT_EQ(page.SingleBtn->parentWidget(), page.MeasFrame);
}

TEST_F(MeasFrmTest, OkStoresEveryChoice) {
    MeasFrm& page = open_page();
    click(page.RepeatBtn);
    click(page.ContBtn);
    click(page.ManualBtn);
    click(page.FreqBtn);
    type(page.BlocksizeTxt, "2048.5");
    type(page.SpanTxt, "76800");
    click(page.doneBtn);

    using namespace global;
    EXPECT_EQ(single_block, flag_false);
    EXPECT_EQ(block_mode, flag_false);
    EXPECT_EQ(trigger_source, 1);
    EXPECT_EQ(domain, 1);
    EXPECT_EQ(multi_mainframe, 0);
    EXPECT_EQ(blocksize, 2048);  // the half goes to the even neighbour
    EXPECT_EQ(span, 76800.0);
    EXPECT_TRUE(messages.empty());
    EXPECT_TRUE(main().isVisible());
    EXPECT_FALSE(page.isVisible());

    open_page();
    click(page.InputBtn);
    click(page.TimeBtn);
    click(page.SingleBtn);
    click(page.BlockBtn);
    type(page.BlocksizeTxt, "  511.5 points");
    type(page.SpanTxt, ".5");
    click(page.doneBtn);
    EXPECT_EQ(single_block, flag_true);
    EXPECT_EQ(block_mode, flag_true);
    EXPECT_EQ(trigger_source, 2);
    EXPECT_EQ(domain, 0);
    EXPECT_EQ(blocksize, 512);
    EXPECT_EQ(span, 0.5);

    open_page();
    click(page.SourceBtn);
    click(page.doneBtn);
    EXPECT_EQ(trigger_source, 3);
}

TEST_F(MeasFrmTest, RefusedBlockSizesAndSpansKeepTheStoredValues) {
    struct Case {
        const char* text;
        bool taken;
        double value;
    };
    const std::vector<Case> sizes = {
        {"0", false, 0},   {"-5", false, 0},   {"abc", false, 0},        {"", false, 0},
        {"0.4", false, 0}, {"3E10", false, 0}, {"2147483648", false, 0}, {"2147483647", true, 2147483647},
        {"0.6", true, 1}};
    for (const Case& c : sizes) {
        global::blocksize = 1024;
        MeasFrm& page = open_page();
        type(page.BlocksizeTxt, c.text);
        click(page.doneBtn);
        EXPECT_EQ(global::blocksize, c.taken ? static_cast<int32_t>(c.value) : 1024) << '"' << c.text << '"';
    }
    const std::vector<Case> spans = {{"76801", false, 0},  {"0", false, 0},
                                     {"-100", false, 0},   {"Hz", false, 0},
                                     {"1E6", false, 0},    {"76800.99", true, 76800.99},
                                     {"1E-3", true, .001}, {"51200 Hz", true, 51200}};
    for (const Case& c : spans) {
        global::span = 20000.0;
        MeasFrm& page = open_page();
        type(page.SpanTxt, c.text);
        click(page.doneBtn);
        EXPECT_EQ(global::span, c.taken ? c.value : 20000.0) << '"' << c.text << '"';
    }
    EXPECT_TRUE(messages.empty());
}

TEST_F(MeasFrmTest, RepeatWithMultiMainframeShowsTheNoticeOnceAndKeepsSingleBlock) {
    MeasFrm& page = open_page();
    click(page.RepeatBtn);
    click(page.mmcheck);
    click(page.doneBtn);
    ASSERT_EQ(messages.size(), 1u);
    EXPECT_EQ(messages[0].kind, dialogs::Kind::notice);
    EXPECT_EQ(messages[0].text,
              "Soft Front Panel does not support repeat and multi mainframe.\r\n\r\n"
              "This is a limitation of this example program, not the Plug&Play library\r\n\r\n"
              "Repeat has been turned off");
    EXPECT_EQ(global::single_block, global::flag_true);
    EXPECT_EQ(global::multi_mainframe, 1);

    open_page();
    EXPECT_TRUE(page.SingleBtn->isChecked());
    EXPECT_TRUE(page.mmcheck->isChecked());
    // Single Block with Multi Mainframe is fine: no further notice.
    click(page.doneBtn);
    EXPECT_EQ(messages.size(), 1u);
}

TEST_F(MeasFrmTest, CancelChangesNothingAndTheNextOpeningShowsTheStoredSettings) {
    MeasFrm& page = open_page();
    click(page.RepeatBtn);
    click(page.ContBtn);
    click(page.SourceBtn);
    click(page.FreqBtn);
    click(page.mmcheck);
    type(page.BlocksizeTxt, "8192");
    type(page.SpanTxt, "400");
    click(page.cancelBtn);

    using namespace global;
    EXPECT_EQ(single_block, flag_true);
    EXPECT_EQ(block_mode, flag_true);
    EXPECT_EQ(trigger_source, 0);
    EXPECT_EQ(domain, 0);
    EXPECT_EQ(multi_mainframe, 0);
    EXPECT_EQ(blocksize, 1024);
    EXPECT_EQ(span, 20000.0);
    EXPECT_TRUE(messages.empty());
    EXPECT_TRUE(main().isVisible());

    open_page();
    EXPECT_TRUE(page.SingleBtn->isChecked());
    EXPECT_TRUE(page.AutoBtn->isChecked());
    EXPECT_FALSE(page.mmcheck->isChecked());
    EXPECT_EQ(page.BlocksizeTxt->text().toStdString(), " 1024");
}

TEST_F(MeasFrmTest, TheNextSetUpSendsWhatOkStored) {
    MeasFrm& page = open_page();
    click(page.ContBtn);
    click(page.FreqBtn);
    click(page.ManualBtn);
    type(page.BlocksizeTxt, "2048");
    type(page.SpanTxt, "10000");
    click(page.doneBtn);
    sim::clear_call_log();
    setup_measurement();  // what Go runs first

    auto sent = [](const std::string& name) {
        for (const sim::Call& c : sim::call_log())
            if (c.name == name)
                return c.args.back();
        return std::string("not sent");
    };
    EXPECT_EQ(sent("ost7720_setBlocksize"), "2048");
    EXPECT_EQ(sent("ost7720_setSpan"), "10000");
    EXPECT_EQ(sent("ost7720_setDataMode"), "341");     // continuous
    EXPECT_EQ(sent("ost7720_setCalcData"), "725");     // frequency
    EXPECT_EQ(sent("ost7720_setAutoTrigger"), "440");  // not automatic
    EXPECT_EQ(sent("ost7720_setArmMode"), "431");      // one mainframe
}

TEST_F(MeasFrmTest, FramesStandInTwoReadableColumns) {
    MeasFrm& page = open_page();
    page.resize(900, 700);
    // Left column: Meas, Mode, Trigger; right column one and a half frame widths further.
    const int left = qRound(900 / 10.0);
    EXPECT_EQ(page.MeasFrame->x(), left);
    EXPECT_EQ(page.ModeFrame->x(), left);
    EXPECT_EQ(page.TrigFrame->x(), left);
    EXPECT_EQ(page.BlocksizeFrame->x(),
              static_cast<int>(std::nearbyint(left + 1.5 * page.MeasFrame->width())));
    EXPECT_EQ(page.SpanFrame->x(), page.BlocksizeFrame->x());
    EXPECT_EQ(page.DomFrm->x(), page.BlocksizeFrame->x());
    // Rows in fourteenths of 700 px: 50 px each.
    EXPECT_EQ(page.MeasFrame->geometry().top(), 50);
    EXPECT_EQ(page.ModeFrame->geometry().top(), 200);
    EXPECT_EQ(page.TrigFrame->geometry().top(), 350);
    EXPECT_EQ(page.TrigFrame->height(), 200);
    EXPECT_EQ(page.SpanFrame->geometry().top(), 50);
    EXPECT_EQ(page.BlocksizeFrame->geometry().top(), 200);
    EXPECT_EQ(page.DomFrm->geometry().top(), 350);
    EXPECT_EQ(page.mmcheck->y(), 500);  // halfway between the lower edges 550 and 450
    EXPECT_EQ(page.AutoBtn->y(), 40);
    EXPECT_EQ(page.SourceBtn->y(), 160);
    EXPECT_EQ(page.AutoBtn->x(), 6);
    EXPECT_EQ(page.TimeBtn->x(), 16);
    EXPECT_EQ(page_check::layout_faults(&page), std::vector<std::string>{});
}

}  // namespace
