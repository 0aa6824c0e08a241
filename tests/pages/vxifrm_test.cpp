// The VXI setup page: the module rows, the choice of modules and the session opened again over
// them, checked against the simulator's call log.
#include <gtest/gtest.h>

#include <QTest>
#include <algorithm>

#include "core/global.h"
#include "core/windows.h"
#include "display/MainFrm.h"
#include "page_readability.h"
#include "pages/VxiFrm.h"
#include "panel_fixture.h"

namespace {

using Names = std::vector<std::string>;

class VxiFrmTest : public PanelTest {
  protected:
    // fail_memory_query: the first module's memory query fails at start-up.
    VxiFrm& open_page(const std::vector<sim::ModuleSpec>& system, bool fail_memory_query = false) {
        use_system(system);
        if (fail_memory_query)
            sim::fail("ost7720_getHWConfig", -1074003951, 1);
        main().Form_Load();
        VxiFrm& page = forms::get<VxiFrm>();
        switch_page(main(), page);
        return page;
    }

    MainFrm& main() { return forms::get<MainFrm>(); }

    static std::string text(const QLabel* l) { return l->text().toStdString(); }

    static std::vector<sim::ModuleSpec> sixteen_modules() {
        std::vector<sim::ModuleSpec> modules;
        for (int32_t m = 1; m <= 16; ++m)
            modules.push_back({m * 8, 8, m % 2, 0, 8});
        return modules;
    }

    static std::vector<const sim::Call*> calls_named(const std::string& name) {
        std::vector<const sim::Call*> out;
        for (const sim::Call& c : sim::call_log())
            if (c.name == name)
                out.push_back(&c);
        return out;
    }
};

TEST_F(VxiFrmTest, OneRowPerModuleWithHeadsInterfaceAndRevision) {
    // The first module's memory query fails: its memory reads "unknown", the other's is unaffected.
    VxiFrm& page = open_page({{8, 8, 1, 2, 8}, {16, 4, 2, 0, 32}}, true);
    EXPECT_EQ(page.windowTitle().toStdString(), "VXI setup");
    ASSERT_EQ(page.LALbl.size(), 3u);
    EXPECT_EQ(text(page.LALbl[0]), "Address");
    EXPECT_EQ(text(page.InpLbl[0]), "Inputs");
    EXPECT_EQ(text(page.SrcLbl[0]), "Sources");
    EXPECT_EQ(text(page.TachLbl[0]), "Tachs");
    EXPECT_EQ(text(page.MemLbl[0]), "Memory");
    EXPECT_TRUE(page.UseCkbx[0]->isHidden());
    EXPECT_FALSE(page.UseCkbx[0]->isEnabled());

    EXPECT_EQ(text(page.LALbl[1]), "8");
    EXPECT_EQ(text(page.InpLbl[1]), "8");
    EXPECT_EQ(text(page.SrcLbl[1]), "1");
    EXPECT_EQ(text(page.TachLbl[1]), "2");
    EXPECT_EQ(text(page.MemLbl[1]), "unknown");
    EXPECT_EQ(text(page.LALbl[2]), "16");
    EXPECT_EQ(text(page.InpLbl[2]), "4");
    EXPECT_EQ(text(page.SrcLbl[2]), "2");
    EXPECT_EQ(text(page.TachLbl[2]), "0");
    EXPECT_EQ(text(page.MemLbl[2]), " 32 MByte");
    for (size_t i = 1; i <= 2; ++i) {
        EXPECT_TRUE(page.UseCkbx[i]->isChecked());
        EXPECT_EQ(page.UseCkbx[i]->text().toStdString(), "Active");
        EXPECT_TRUE(page.LALbl[i]->isVisible());
    }

    EXPECT_EQ(text(page.VName), "Resource Name");
    EXPECT_EQ(text(page.revlbl), "Driver Rev.");
    EXPECT_EQ(page.RNameTxt->text().toStdString(), "VXI0");
    EXPECT_EQ(page.revtxt->text().toStdString(), global::driver_revision);
    EXPECT_FALSE(global::driver_revision.empty());
    // Interface name, revision and heads share one line each, above the first module row.
    EXPECT_EQ(page.RNameTxt->y(), page.revtxt->y());
    EXPECT_LT(page.revtxt->y(), page.InpLbl[0]->y());
    EXPECT_LT(page.InpLbl[0]->y(), page.InpLbl[1]->y());
    EXPECT_TRUE(messages.empty());
}

TEST_F(VxiFrmTest, RowHeightIsATwentiethBelowSixteenModulesAndCountPlusTenFrom) {
    VxiFrm& page = open_page({{8, 8, 1, 2, 8}, {16, 4, 2, 0, 32}});
    page.resize(900, 780);  // inner height 780 px: 39 px a twentieth
    for (size_t i = 1; i <= 2; ++i) {
        EXPECT_EQ(page.LALbl[i]->height(), 39);
        EXPECT_EQ(page.MemLbl[i]->height(), 39);
        EXPECT_EQ(page.LALbl[i]->y(), static_cast<int>(i + 3) * 39);
        EXPECT_EQ(page.UseCkbx[i]->y(), page.LALbl[i]->y());
    }
    EXPECT_EQ(page.LALbl[1]->x(), 90);
    EXPECT_EQ(page.UseCkbx[1]->x(), 135);
    EXPECT_EQ(page.MemLbl[1]->x(), 540);

    forms::destroy_all();
    VxiFrm& big = open_page(sixteen_modules());
    big.resize(900, 780);  // 26 rows of 30 px
    ASSERT_EQ(big.LALbl.size(), 17u);
    for (size_t i = 1; i <= 16; ++i) {
        EXPECT_EQ(big.LALbl[i]->height(), 30);
        EXPECT_EQ(big.LALbl[i]->y(), static_cast<int>(i + 3) * 30);
        EXPECT_EQ(text(big.LALbl[i]), std::to_string(8 * i));
        EXPECT_EQ(text(big.SrcLbl[i]), i % 2 == 1 ? "1" : "0");
    }
    EXPECT_EQ(page_check::layout_faults(&big), std::vector<std::string>{});
}

TEST_F(VxiFrmTest, RowsOfFourteenOrFifteenModulesShrinkToEndAboveOk) {
    std::vector<sim::ModuleSpec> modules = sixteen_modules();
    modules.resize(15);
    VxiFrm& page = open_page(modules);
    page.resize(900, 700);
    // Twenty rows of 35 px would put module 15 at 630..665 px, across OK (near 0.9 of the
    // height); the rows take the whole pixels that end above it: 19 x 31 = 589.
    EXPECT_EQ(page.LALbl[15]->height(), 31);
    EXPECT_EQ(page.LALbl[15]->geometry().bottom(), 19 * 31 - 1);
    EXPECT_LT(page.LALbl[15]->geometry().bottom(), page.doneBtn->y());
    EXPECT_EQ(page_check::layout_faults(&page), std::vector<std::string>{});

    // Thirteen modules fit in twenty rows: 17 x 35 = 595 px.
    forms::destroy_all();
    modules.resize(13);
    VxiFrm& thirteen = open_page(modules);
    thirteen.resize(900, 700);
    EXPECT_EQ(thirteen.LALbl[13]->height(), 35);
    EXPECT_LT(thirteen.LALbl[13]->geometry().bottom(), thirteen.doneBtn->y());
}

TEST_F(VxiFrmTest, UncheckedModuleLeavesTheSessionAfterOk) {
    VxiFrm& page = open_page({{8, 8, 1, 2, 8}, {16, 4, 2, 0, 32}});
    const int32_t old_session = global::session;
    sim::clear_call_log();

    QTest::mouseClick(page.UseCkbx[1], Qt::LeftButton);
    EXPECT_FALSE(page.UseCkbx[1]->isChecked());
    EXPECT_EQ(page.UseCkbx[1]->text().toStdString(), "Inactive");
    EXPECT_EQ(global::module_use[0], global::flag_false);
    EXPECT_EQ(global::module_use[1], global::flag_true);
    EXPECT_TRUE(sim::call_log().empty());  // reaches the module only with OK
    EXPECT_EQ(global::session, old_session);

    QTest::mouseClick(page.doneBtn, Qt::LeftButton);
    EXPECT_EQ(sim::call_names(), (Names{"ost7720_close", "ost7720_init", "ost7720_getNumChans",
                                        "ost7720_revision_query", "ost7720_deleteAllChanGroups",
                                        "ost7720_createChannelGroup", "ost7720_createChannelGroup",
                                        "ost7720_createChannelGroup", "ost7720_createChannelGroup"}));
    EXPECT_EQ(sim::call_log()[1].args.at(0), "\"VXI0::16::INSTR\"");

    using namespace global;
    EXPECT_NE(session, 0);
    EXPECT_EQ(num_inputs, 4);
    EXPECT_EQ(input_ids, (std::vector<int32_t>{1, 2, 3, 4, 0}));
    EXPECT_EQ(source_ids, (std::vector<int32_t>{4097, 4098, 0}));
    EXPECT_EQ(num_tachs, 0);
    EXPECT_EQ(all_ids, (std::vector<int32_t>{1, 2, 3, 4, 4097, 4098, 0}));
    const auto groups = calls_named("ost7720_createChannelGroup");
    ASSERT_EQ(groups.size(), 4u);
    EXPECT_EQ(groups[0]->args.at(1), "4");  // inputs
    EXPECT_EQ(groups[1]->args.at(1), "2");  // sources
    EXPECT_EQ(groups[2]->args.at(1), "0");  // tachs
    EXPECT_EQ(groups[3]->args.at(1), "6");  // all
    EXPECT_TRUE(messages.empty());
    EXPECT_TRUE(main().isVisible());
    EXPECT_FALSE(page.isVisible());
    EXPECT_EQ(page.doneBtn->text().toStdString(), "OK");

    // Back on the page the module still reads Inactive; taking it in again lists both, the last
    // found first.
    switch_page(main(), page);
    EXPECT_EQ(page.UseCkbx[1]->text().toStdString(), "Inactive");
    QTest::mouseClick(page.UseCkbx[1], Qt::LeftButton);
    EXPECT_EQ(page.UseCkbx[1]->text().toStdString(), "Active");
    EXPECT_EQ(global::module_use[0], global::flag_true);
    sim::clear_call_log();
    QTest::mouseClick(page.doneBtn, Qt::LeftButton);
    EXPECT_EQ(calls_named("ost7720_init").at(0)->args.at(0), "\"VXI0::16,8::INSTR\"");
    EXPECT_EQ(global::num_inputs, 12);
}

TEST_F(VxiFrmTest, OkShowsWaitWithTheBusyCursorWhileTheSessionReopens) {
    VxiFrm& page = open_page({{8, 8, 1, 2, 8}});
    // A failing init raises the report in the middle of the re-open: look at the button then.
    sim::fail("ost7720_init", -1074003951, 1);
    std::string caption_meanwhile;
    Qt::CursorShape cursor_meanwhile = Qt::ArrowCursor;
    bool page_up_meanwhile = false;
    dialogs::set_responder([&](dialogs::Kind, const std::string&) {
        caption_meanwhile = page.doneBtn->text().toStdString();
        cursor_meanwhile = page.doneBtn->cursor().shape();
        page_up_meanwhile = page.isVisible() && !main().isVisible();
        return dialogs::Answer::yes;
    });
    QTest::mouseClick(page.doneBtn, Qt::LeftButton);
    EXPECT_EQ(caption_meanwhile, "WAIT");
    EXPECT_EQ(cursor_meanwhile, Qt::WaitCursor);
    EXPECT_TRUE(page_up_meanwhile);
    EXPECT_EQ(page.doneBtn->text().toStdString(), "OK");
    EXPECT_FALSE(page.doneBtn->testAttribute(Qt::WA_SetCursor));
    EXPECT_TRUE(main().isVisible());
}

TEST_F(VxiFrmTest, AllModulesUncheckedOpensNoSessionAndThePanelGoesOn) {
    VxiFrm& page = open_page({{8, 8, 1, 2, 8}});
    sim::clear_call_log();
    QTest::mouseClick(page.UseCkbx[1], Qt::LeftButton);
    QTest::mouseClick(page.doneBtn, Qt::LeftButton);

    const Names names = sim::call_names();
    EXPECT_EQ(std::count(names.begin(), names.end(), "ost7720_init"), 0);
    EXPECT_EQ(names.front(), "ost7720_close");
    EXPECT_EQ(global::session, 0);
    EXPECT_EQ(global::num_inputs, 0);
    EXPECT_EQ(global::input_ids.size(), 1u);
    // Whatever the driver answers for handle 0 is reported, and Yes goes on.
    for (const Message& m : messages)
        EXPECT_EQ(m.kind, dialogs::Kind::question);
    EXPECT_TRUE(main().isVisible());

    main().GoBtn_Click();
    main().stop_measurement();
    EXPECT_TRUE(main().isVisible());

    // The module can be taken back.
    switch_page(main(), page);
    EXPECT_FALSE(page.UseCkbx[1]->isChecked());
    QTest::mouseClick(page.UseCkbx[1], Qt::LeftButton);
    QTest::mouseClick(page.doneBtn, Qt::LeftButton);
    EXPECT_NE(global::session, 0);
    EXPECT_EQ(global::num_inputs, 8);
}

TEST_F(VxiFrmTest, CancelIsNeverVisible) {
    VxiFrm& page = open_page({{8, 8, 1, 2, 8}, {16, 4, 2, 0, 32}});
    EXPECT_TRUE(page.cancelBtn->isHidden());
    EXPECT_FALSE(page.cancelBtn->isEnabled());
    page.cancelBtn->show();
    page.cancelBtn->setEnabled(true);
    page.resize(page.width() + 20, page.height());
    EXPECT_TRUE(page.cancelBtn->isHidden());
    EXPECT_FALSE(page.cancelBtn->isEnabled());
    EXPECT_TRUE(page.doneBtn->isVisible());
    EXPECT_EQ(page_check::layout_faults(&page), std::vector<std::string>{});
}

}  // namespace
