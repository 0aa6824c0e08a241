// The Display Controls page: which channel each trace shows and the trace files.
#include <gtest/gtest.h>

#include "page_fixture.h"
#include "pages/DispFrm.h"

namespace {

class DispFrmTest : public PageTest {
  protected:
    DispFrm& open() {
        main().DispBtn_Click();
        return forms::get<DispFrm>();
    }
    static Texts shown(const DispFrm& page) {
        Texts out;
        for (const QComboBox* box : page.TrcChanCmbo)
            out.push_back(text(box));
        return out;
    }
};

TEST_F(DispFrmTest, FirstVisitShowsTraceOneOnChannelOneAndListsEveryInput) {
    DispFrm& page = open();
    EXPECT_TRUE(page.isVisible());
    EXPECT_FALSE(main().isVisible());
    EXPECT_EQ(shown(page), (Texts{"1", "OFF", "OFF", "OFF"}));
    for (const QComboBox* box : page.TrcChanCmbo)
        EXPECT_EQ(items(box), (Texts{"OFF", "1", "2", "3", "4", "5", "6", "7", "8", "9", "10", "11", "12",
                                     "13", "14", "15", "16"}));
    start({{8, 2, 0, 0, 8}});
    EXPECT_EQ(items(open().TrcChanCmbo[3]), (Texts{"OFF", "1", "2"}));
}

TEST_F(DispFrmTest, OkStoresChannelsAndFilesAndTheMainWindowShowsTheTraceLeft) {
    DispFrm& page = open();
    type(page.TrcChanCmbo[0], "OFF");
    type(page.TrcChanCmbo[1], "3");
    type(page.Text1[1], "/tmp/trace two.txt");
    click(page.doneBtn);
    EXPECT_EQ(global::trace_channel, (std::array<int32_t, 5>{0, 3, 0, 0, 0}));
    EXPECT_EQ(global::trace_file[1], "/tmp/trace two.txt");
    EXPECT_FALSE(page.isVisible());
    // One trace, labelled with its channel, at the top.
    EXPECT_TRUE(main().isVisible());
    EXPECT_EQ(text(main().ChanLbl[0]), "Chan 3");
    EXPECT_TRUE(main().CRTpic[0]->isVisible());
    EXPECT_FALSE(main().CRTpic[1]->isVisible());
    EXPECT_FALSE(main().ChanLbl[1]->isVisible());

    open();
    EXPECT_EQ(shown(page), (Texts{"OFF", "3", "OFF", "OFF"}));
    EXPECT_EQ(text(page.Text1[1]), "/tmp/trace two.txt");
}

TEST_F(DispFrmTest, TypedChannelTextsBecomeRoundedChannelsOrOff) {
    DispFrm& page = open();
    struct Case {
        const char* text;
        int32_t channel;
    };
    // Halves go to the even neighbour; "off" and text without a leading number turn the trace
    // off; a number past the inputs is kept; one no channel id can hold turns the trace off
    // rather than wrapping to another channel.
    const Case cases[] = {{"2.5", 2},   {"3.5", 4},  {"off", 0},         {"Chan 5", 0},
                          {" 7abc", 7}, {"17", 17},  {"-2", -2},         {"1E1", 10},
                          {"", 0},      {"4.49", 4}, {"99999999999", 0}, {"-3000000000", 0}};
    for (size_t c = 0; c < std::size(cases); c += 4) {
        open();
        for (size_t i = 0; i < 4; ++i)
            type(page.TrcChanCmbo[i], cases[c + i].text);
        click(page.doneBtn);
        for (size_t i = 0; i < 4; ++i)
            EXPECT_EQ(global::trace_channel[i], cases[c + i].channel) << '"' << cases[c + i].text << '"';
    }
    // The box keeps what was typed.
    open();
    EXPECT_EQ(text(page.TrcChanCmbo[2]), "99999999999");
}

TEST_F(DispFrmTest, CancelAndResizeDropWhatOkDidNotStore) {
    DispFrm& page = open();
    type(page.TrcChanCmbo[2], "5");
    type(page.Text1[2], "first.txt");
    click(page.doneBtn);

    open();
    type(page.TrcChanCmbo[2], "9");
    type(page.Text1[2], "second.txt");
    page.resize(page.width() + 40, page.height() + 30);
    EXPECT_EQ(text(page.TrcChanCmbo[2]), "5");
    EXPECT_EQ(text(page.Text1[2]), "first.txt");

    type(page.TrcChanCmbo[0], "6");
    type(page.Text1[0], "x.txt");
    click(page.cancelBtn);
    EXPECT_TRUE(main().isVisible());
    EXPECT_EQ(global::trace_channel, (std::array<int32_t, 5>{1, 0, 5, 0, 0}));
    EXPECT_EQ(global::trace_file[0], "");
    open();
    EXPECT_EQ(shown(page), (Texts{"1", "OFF", "5", "OFF"}));
    EXPECT_EQ(text(page.Text1[0]), "");
}

TEST_F(DispFrmTest, LayoutFollowsThePageSizeAndStaysReadable) {
    DispFrm& page = open();
    // 960 x 720 px: rows of 720 / 7 px, columns of 120 px.
    page.resize(960, 720);
    for (size_t i = 0; i < 4; ++i) {
        const int top = qRound((i + 2) * 720.0 / 7);
        EXPECT_EQ(page.Label1[i]->pos(), QPoint(120, top));
        EXPECT_EQ(page.TrcChanCmbo[i]->pos(), QPoint(360, top));
        EXPECT_EQ(page.Text1[i]->geometry(), QRect(600, top, 357, page.Text1[i]->height()));
    }
    EXPECT_EQ(page_check::layout_faults(&page), Texts{});
}

}  // namespace
