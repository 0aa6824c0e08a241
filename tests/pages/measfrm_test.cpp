// The Measurement Control page: what it shows, what OK takes and refuses, the repeat notice, and
// what the next measurement set-up sends.
#include <gtest/gtest.h>

#include <cmath>

#include "measure/measurement.h"
#include "page_fixture.h"
#include "pages/MeasFrm.h"

namespace {

using global::flag_false;
using global::flag_true;

class MeasFrmTest : public PageTest {
  protected:
    MeasFrm& open() {
        main().MeasBtn_Click();
        return forms::get<MeasFrm>();
    }
    // single block, block mode, trigger source, domain, multi mainframe, block size, span
    static std::vector<double> stored() {
        using namespace global;
        return {double(single_block),
                double(block_mode),
                double(trigger_source),
                double(domain),
                double(multi_mainframe),
                double(blocksize),
                span};
    }
    // The captions of the options checked, the designed blanks and spelling included.
    static Texts checked(const MeasFrm& p) {
        Texts out;
        for (const QAbstractButton* b : std::initializer_list<const QAbstractButton*>{
                 p.SingleBtn, p.RepeatBtn, p.BlockBtn, p.ContBtn, p.AutoBtn, p.ManualBtn, p.InputBtn,
                 p.SourceBtn, p.TimeBtn, p.FreqBtn, p.mmcheck})
            if (b->isChecked())
                out.push_back(b->text().toStdString());
        return out;
    }
    static void click_all(std::initializer_list<QAbstractButton*> buttons) {
        for (QAbstractButton* b : buttons)
            click(b);
    }
};

TEST_F(MeasFrmTest, OpeningShowsTheStoredSettingsAndCancelKeepsThem) {
    MeasFrm& page = open();
    EXPECT_EQ(page.MeasFrame->title().toStdString(), "Meas ");
    EXPECT_EQ(checked(page), (Texts{"Single Block", "Block ", "Auto", "Time"}));
    EXPECT_EQ(text(page.BlocksizeTxt), " 1024");
    EXPECT_EQ(text(page.SpanTxt), " 20000");

    click_all({page.RepeatBtn, page.ContBtn, page.SourceBtn, page.FreqBtn, page.mmcheck});
    type(page.BlocksizeTxt, "8192");
    type(page.SpanTxt, "400");
    click(page.cancelBtn);
    EXPECT_TRUE(main().isVisible());
    EXPECT_EQ(stored(), (std::vector<double>{flag_true, flag_true, 0, 0, 0, 1024, 20000}));

    global::single_block = global::block_mode = flag_false;
    global::trigger_source = 3;
    global::domain = global::multi_mainframe = 1;
    global::blocksize = 4096;
    global::span = 12800.5;
    open();
    EXPECT_EQ(checked(page), (Texts{"Repeat", "Continous", "Source", "Frequency", "Multi Mainframe"}));
    EXPECT_EQ(text(page.BlocksizeTxt), " 4096");
    EXPECT_EQ(text(page.SpanTxt), " 12800.5");
    EXPECT_TRUE(messages.empty());
}

TEST_F(MeasFrmTest, OkStoresEveryChoiceAndTheNextSetUpSendsIt) {
    MeasFrm& page = open();
    click_all({page.RepeatBtn, page.ContBtn, page.ManualBtn, page.FreqBtn});
    type(page.BlocksizeTxt, "2048.5");  // the half goes to the even neighbour
    type(page.SpanTxt, "10000");
    click(page.doneBtn);
    EXPECT_TRUE(main().isVisible());
    EXPECT_EQ(stored(), (std::vector<double>{flag_false, flag_false, 1, 1, 0, 2048, 10000}));
    // The next set-up (what Go runs first) sends them.
    sim::clear_call_log();
    setup_measurement();
    auto sent = [](const std::string& name) {
        for (const sim::Call& c : sim::call_log())
            if (c.name == "ost7720_" + name)
                return c.args.back();
        return std::string("not sent");
    };
    EXPECT_EQ(sent("setBlocksize"), "2048");
    EXPECT_EQ(sent("setSpan"), "10000");
    EXPECT_EQ(sent("setDataMode"), "341");     // continuous
    EXPECT_EQ(sent("setCalcData"), "725");     // frequency
    EXPECT_EQ(sent("setAutoTrigger"), "440");  // not automatic
    EXPECT_EQ(sent("setArmMode"), "431");      // one mainframe

    click_all({open().SingleBtn, page.BlockBtn, page.InputBtn, page.TimeBtn, page.doneBtn});
    EXPECT_EQ(stored(), (std::vector<double>{flag_true, flag_true, 2, 0, 0, 2048, 10000}));
    click_all({open().SourceBtn, page.doneBtn});
    EXPECT_EQ(global::trigger_source, 3);
    EXPECT_TRUE(messages.empty());
}

TEST_F(MeasFrmTest, RefusedBlockSizesAndSpansKeepTheStoredValues) {
    struct Case {
        bool span;
        const char* typed;
        double stored;  // 1024 and 20000 were there before: refused
    };
    const Case cases[] = {{false, "0", 1024},
                          {false, "-5", 1024},
                          {false, "abc", 1024},
                          {false, "0.4", 1024},
                          {false, "3E10", 1024},
                          {false, "2147483648", 1024},
                          {false, "2147483647", 2147483647},
                          {false, "  511.5 points", 512},
                          {true, "76800", 76800},
                          {true, "76801", 20000},
                          {true, "0", 20000},
                          {true, "-100", 20000},
                          {true, "Hz", 20000},
                          {true, "76800.99", 76800.99},
                          {true, "1E-3", .001},
                          {true, "51200 Hz", 51200}};
    for (const Case& c : cases) {
        global::blocksize = 1024;
        global::span = 20000.0;
        MeasFrm& page = open();
        type(c.span ? page.SpanTxt : page.BlocksizeTxt, c.typed);
        click(page.doneBtn);
        EXPECT_EQ(c.span ? global::span : global::blocksize, c.stored) << '"' << c.typed << '"';
    }
    EXPECT_TRUE(messages.empty());
}

TEST_F(MeasFrmTest, RepeatWithMultiMainframeShowsTheNoticeOnceAndKeepsSingleBlock) {
    MeasFrm& page = open();
    click_all({page.RepeatBtn, page.mmcheck, page.doneBtn});
    EXPECT_EQ(notices(), Texts{"Soft Front Panel does not support repeat and multi mainframe.\r\n\r\n"
                               "This is a limitation of this example program, not the Plug&Play library\r\n"
                               "\r\nRepeat has been turned off"});
    EXPECT_EQ(global::single_block, flag_true);
    EXPECT_EQ(global::multi_mainframe, 1);
    EXPECT_EQ(checked(open()), (Texts{"Single Block", "Block ", "Auto", "Time", "Multi Mainframe"}));
    click(page.doneBtn);
    EXPECT_EQ(messages.size(), 1u);
}

TEST_F(MeasFrmTest, FramesStandInTwoReadableColumns) {
    MeasFrm& page = open();
    page.resize(900, 700);
    // Left column at a tenth of the width, right one a frame and a half further; rows of 50 px.
    const int left = 90;
    const int right = static_cast<int>(std::nearbyint(left + 1.5 * page.MeasFrame->width()));
    EXPECT_EQ(page.MeasFrame->pos(), QPoint(left, 50));
    EXPECT_EQ(page.ModeFrame->pos(), QPoint(left, 200));
    EXPECT_EQ(page.TrigFrame->geometry(), QRect(left, 350, page.MeasFrame->width(), 200));
    EXPECT_EQ(page.SpanFrame->pos(), QPoint(right, 50));
    EXPECT_EQ(page.BlocksizeFrame->pos(), QPoint(right, 200));
    EXPECT_EQ(page.DomFrm->pos(), QPoint(right, 350));
    EXPECT_EQ(page.mmcheck->y(), 500);  // halfway between the lower edges 550 and 450
    EXPECT_EQ(page.AutoBtn->pos(), QPoint(6, 40));
    EXPECT_EQ(page.TimeBtn->x(), 16);
    EXPECT_EQ(page_check::layout_faults(&page), Texts{});
}

}  // namespace
