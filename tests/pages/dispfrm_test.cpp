// The Display Controls page: which channel each trace shows and the trace files, through the
// page's widgets.
#include <gtest/gtest.h>

#include <QTest>

#include "core/global.h"
#include "core/windows.h"
#include "display/MainFrm.h"
#include "page_readability.h"
#include "pages/DispFrm.h"
#include "panel_fixture.h"

namespace {

class DispFrmTest : public PanelTest {
  protected:
    // A started panel over one module of 16 inputs, with the page in the main window's place.
    DispFrm& open_page(const std::vector<sim::ModuleSpec>& system = {{8, 16, 1, 0, 8}}) {
        use_system(system);
        main().Form_Load();
        DispFrm& page = forms::get<DispFrm>();
        switch_page(main(), page);
        return page;
    }

    MainFrm& main() { return forms::get<MainFrm>(); }

    static void type(QComboBox* box, const char* text) {
        box->lineEdit()->clear();
        QTest::keyClicks(box->lineEdit(), QString::fromUtf8(text));
    }

    static void type(QLineEdit* box, const char* text) {
        box->clear();
        QTest::keyClicks(box, QString::fromUtf8(text));
    }

    static std::vector<std::string> items(const QComboBox* box) {
        std::vector<std::string> out;
        for (int i = 0; i < box->count(); ++i)
            out.push_back(box->itemText(i).toStdString());
        return out;
    }

    static std::vector<std::string> texts(const DispFrm& page) {
        std::vector<std::string> out;
        for (const QComboBox* box : page.TrcChanCmbo)
            out.push_back(box->currentText().toStdString());
        return out;
    }
};

using Texts = std::vector<std::string>;

TEST_F(DispFrmTest, FirstVisitShowsTraceOneOnChannelOneAndListsEveryInput) {
    DispFrm& page = open_page();
    EXPECT_TRUE(page.isVisible());
    EXPECT_FALSE(main().isVisible());
    EXPECT_EQ(page.windowTitle().toStdString(), "Display Controls");
    EXPECT_EQ(texts(page), (Texts{"1", "OFF", "OFF", "OFF"}));
    const Texts expected = {"OFF", "1",  "2",  "3",  "4",  "5",  "6",  "7", "8",
                            "9",   "10", "11", "12", "13", "14", "15", "16"};
    for (const QComboBox* box : page.TrcChanCmbo) {
        EXPECT_TRUE(box->isEditable());
        EXPECT_EQ(items(box), expected);
    }
    for (size_t i = 0; i < 4; ++i) {
        EXPECT_EQ(page.Label1[i]->text().toStdString(), "Trace #" + std::to_string(i + 1));
        EXPECT_TRUE(page.Text1[i]->text().isEmpty());
    }
    EXPECT_EQ(page.Label2->text().toStdString(), "Trace");
    EXPECT_EQ(page.Label3->text().toStdString(), "Input Channel");
    EXPECT_EQ(page.Label4->text().toStdString(), "Output File");
}

TEST_F(DispFrmTest, OkStoresChannelsAndFilesAndTheNextVisitShowsThem) {
    DispFrm& page = open_page();
    type(page.TrcChanCmbo[0], "OFF");
    type(page.TrcChanCmbo[1], "3");
    type(page.Text1[1], "/tmp/trace two.txt");
    QTest::mouseClick(page.doneBtn, Qt::LeftButton);

    using namespace global;
    EXPECT_EQ(trace_channel, (std::array<int32_t, 5>{0, 3, 0, 0, 0}));
    EXPECT_EQ(trace_file[0], "");
    EXPECT_EQ(trace_file[1], "/tmp/trace two.txt");  // as typed, blank included
    EXPECT_TRUE(main().isVisible());
    EXPECT_FALSE(page.isVisible());
    EXPECT_FALSE(page.isEnabled());
    // The main window shows the one trace left, labelled with its channel, at the top.
    EXPECT_TRUE(main().ChanLbl[0]->isVisible());
    EXPECT_EQ(main().ChanLbl[0]->text().toStdString(), "Chan 3");
    EXPECT_FALSE(main().ChanLbl[1]->isVisible());
    EXPECT_TRUE(main().CRTpic[0]->isVisible());
    EXPECT_FALSE(main().CRTpic[1]->isVisible());

    switch_page(main(), page);
    EXPECT_EQ(texts(page), (Texts{"OFF", "3", "OFF", "OFF"}));
    EXPECT_EQ(page.Text1[1]->text().toStdString(), "/tmp/trace two.txt");
}

TEST_F(DispFrmTest, TypedChannelTextsBecomeRoundedChannelsOrOff) {
    DispFrm& page = open_page();
    struct Case {
        const char* text;
        int32_t channel;
    };
    // Halves go to the even neighbour; text without a leading number, and "off" in lower case,
    // turn the trace off; a number past the inputs is kept (the trace then shows no data); a
    // number no channel id can hold turns the trace off instead of wrapping to another channel.
    const std::vector<Case> cases = {{"2.5", 2},   {"3.5", 4},  {"off", 0},         {"Chan 5", 0},
                                     {" 7abc", 7}, {"17", 17},  {"-2", -2},         {"1E1", 10},
                                     {"", 0},      {"4.49", 4}, {"99999999999", 0}, {"-3000000000", 0}};
    for (size_t c = 0; c < cases.size(); c += 4) {
        for (size_t i = 0; i < 4; ++i)
            type(page.TrcChanCmbo[i], cases[c + i].text);
        QTest::mouseClick(page.doneBtn, Qt::LeftButton);
        for (size_t i = 0; i < 4; ++i) {
            EXPECT_EQ(global::trace_channel[i], cases[c + i].channel) << '"' << cases[c + i].text << '"';
            EXPECT_EQ(page.trace_choice[i], cases[c + i].text);
        }
        switch_page(main(), page);
    }
    // The box keeps what was typed, letter case included.
    EXPECT_EQ(page.TrcChanCmbo[2]->currentText().toStdString(), "99999999999");
}

TEST_F(DispFrmTest, ResizeRestoresUnconfirmedBoxesFromTheStoredChoices) {
    DispFrm& page = open_page();
    type(page.TrcChanCmbo[2], "5");
    type(page.Text1[2], "first.txt");
    QTest::mouseClick(page.doneBtn, Qt::LeftButton);
    switch_page(main(), page);

    type(page.TrcChanCmbo[2], "9");
    type(page.Text1[2], "second.txt");
    page.resize(page.width() + 40, page.height() + 30);
    EXPECT_EQ(page.TrcChanCmbo[2]->currentText().toStdString(), "5");
    EXPECT_EQ(page.Text1[2]->text().toStdString(), "first.txt");

    QTest::mouseClick(page.doneBtn, Qt::LeftButton);
    EXPECT_EQ(global::trace_channel[2], 5);
    EXPECT_EQ(global::trace_file[2], "first.txt");
}

TEST_F(DispFrmTest, CancelStoresNothing) {
    DispFrm& page = open_page();
    type(page.TrcChanCmbo[0], "6");
    type(page.TrcChanCmbo[3], "2");
    type(page.Text1[0], "x.txt");
    QTest::mouseClick(page.cancelBtn, Qt::LeftButton);

    EXPECT_EQ(global::trace_channel, (std::array<int32_t, 5>{1, 0, 0, 0, 0}));
    EXPECT_EQ(global::trace_file[0], "");
    EXPECT_EQ(page.trace_choice[0], "1");
    EXPECT_EQ(page.trace_choice[3], "OFF");
    EXPECT_TRUE(main().isVisible());
    EXPECT_FALSE(page.isVisible());

    switch_page(main(), page);
    EXPECT_EQ(texts(page), (Texts{"1", "OFF", "OFF", "OFF"}));
    EXPECT_TRUE(page.Text1[0]->text().isEmpty());
}

TEST_F(DispFrmTest, ListsFollowTheSessionsInputs) {
    DispFrm& page = open_page({{8, 2, 0, 0, 8}});
    EXPECT_EQ(items(page.TrcChanCmbo[3]), (Texts{"OFF", "1", "2"}));
}

TEST_F(DispFrmTest, LayoutFollowsThePageSizeAndStaysReadable) {
    DispFrm& page = open_page();
    // 960 x 720 px at 15 twips a pixel: row unit 10800 / 7 twips, column unit 1800 twips (120 px).
    page.resize(960, 720);
    for (size_t i = 0; i < 4; ++i) {
        const int top = qRound((i + 2) * 720.0 / 7);
        EXPECT_EQ(page.Label1[i]->geometry().topLeft(), QPoint(120, top));
        EXPECT_EQ(page.TrcChanCmbo[i]->geometry().topLeft(), QPoint(360, top));
        EXPECT_EQ(page.TrcChanCmbo[i]->width(), page.TrcChanCmbo[0]->width());
        EXPECT_EQ(page.Text1[i]->geometry(), QRect(600, top, 357, page.Text1[i]->height()));  // 5350 twips
    }
    EXPECT_EQ(page.Label4->geometry().topLeft(), QPoint(600, qRound(720.0 / 7)));
    EXPECT_EQ(page_check::layout_faults(&page), std::vector<std::string>{});
}

}  // namespace
