// The VXI setup page: the module rows, the choice of modules and the session opened again over
// them, checked against the simulator's call log.
#include <gtest/gtest.h>

#include <algorithm>

#include "page_fixture.h"
#include "pages/VxiFrm.h"

namespace {

const std::vector<sim::ModuleSpec> two_modules = {{8, 8, 1, 2, 8}, {16, 4, 2, 0, 32}};

class VxiFrmTest : public PageTest {
  protected:
    // fail_memory_query: the first module's memory query fails at start-up.
    VxiFrm& open(const std::vector<sim::ModuleSpec>& system, bool fail_memory_query = false) {
        forms::destroy_all();
        use_system(system);
        if (fail_memory_query)
            sim::fail("ost7720_getHWConfig", -1074003951, 1);
        main().Form_Load();
        main().VxiBtn_Click();
        return forms::get<VxiFrm>();
    }
    static Texts row(const VxiFrm& page, size_t i) {
        return {text(page.LALbl[i]),   page.UseCkbx[i]->text().toStdString(),
                text(page.InpLbl[i]),  text(page.SrcLbl[i]),
                text(page.TachLbl[i]), text(page.MemLbl[i])};
    }
};

TEST_F(VxiFrmTest, OneRowPerModuleUnderTheHeadsWithInterfaceRevisionAndNoCancel) {
    VxiFrm& page = open(two_modules, true);
    ASSERT_EQ(page.LALbl.size(), 3u);
    EXPECT_TRUE(page.UseCkbx[0]->isHidden());
    EXPECT_EQ(row(page, 0), (Texts{"Address", "Check1", "Inputs", "Sources", "Tachs", "Memory"}));
    // A memory query that failed reads "unknown"; the other module's is unaffected.
    EXPECT_EQ(row(page, 1), (Texts{"8", "Active", "8", "1", "2", "unknown"}));
    EXPECT_EQ(row(page, 2), (Texts{"16", "Active", "4", "2", "0", " 32 MByte"}));
    EXPECT_TRUE(page.UseCkbx[1]->isChecked() && page.UseCkbx[2]->isChecked());
    EXPECT_EQ(text(page.RNameTxt), "VXI0");
    EXPECT_FALSE(global::driver_revision.empty());
    EXPECT_EQ(text(page.revtxt), global::driver_revision);
    EXPECT_EQ(page.RNameTxt->y(), page.revtxt->y());
    EXPECT_LT(page.revtxt->y(), page.InpLbl[0]->y());
    EXPECT_LT(page.InpLbl[0]->y(), page.InpLbl[1]->y());
    EXPECT_TRUE(messages.empty());
    // Cancel never shows, even after a resize.
    page.cancelBtn->show();
    page.cancelBtn->setEnabled(true);
    page.resize(page.width() + 20, page.height());
    EXPECT_TRUE(page.cancelBtn->isHidden());
    EXPECT_FALSE(page.cancelBtn->isEnabled());
}

TEST_F(VxiFrmTest, RowsAreATwentiethBelowSixteenModulesAndCountPlusTenFromThenEndAboveOk) {
    struct Case {
        size_t modules;
        int height;  // of the page, px
        int row;     // px
    };
    // Fifteen modules in twenty rows of 35 px would run across OK: the rows take the whole
    // pixels that end above it, 19 x 31 = 589.
    for (const Case c : {Case{2, 780, 39}, Case{13, 700, 35}, Case{15, 700, 31}, Case{16, 780, 30}}) {
        SCOPED_TRACE(c.modules);
        std::vector<sim::ModuleSpec> system;
        for (int32_t m = 1; m <= static_cast<int32_t>(c.modules); ++m)
            system.push_back({m * 8, 8, m % 2, 0, 8});
        VxiFrm& page = open(system);
        page.resize(900, c.height);
        ASSERT_EQ(page.LALbl.size(), c.modules + 1);
        for (size_t i = 1; i <= c.modules; ++i) {
            EXPECT_EQ(page.LALbl[i]->geometry(),
                      QRect(90, static_cast<int>(i + 3) * c.row, page.LALbl[i]->width(), c.row));
            EXPECT_EQ(page.UseCkbx[i]->pos(), QPoint(135, page.LALbl[i]->y()));
            EXPECT_EQ(page.MemLbl[i]->pos(), QPoint(540, page.LALbl[i]->y()));
        }
        EXPECT_LT(page.LALbl[c.modules]->geometry().bottom(), page.doneBtn->y());
        EXPECT_EQ(page_check::layout_faults(&page), Texts{});
    }
}

TEST_F(VxiFrmTest, UncheckedModuleLeavesTheSessionAfterOk) {
    VxiFrm& page = open(two_modules);
    sim::clear_call_log();
    click(page.UseCkbx[1]);
    EXPECT_EQ(page.UseCkbx[1]->text().toStdString(), "Inactive");
    EXPECT_TRUE(sim::call_log().empty());  // reaches the module only with OK

    click(page.doneBtn);
    EXPECT_EQ(sim::call_names(), (Texts{"ost7720_close", "ost7720_init", "ost7720_getNumChans",
                                        "ost7720_revision_query", "ost7720_deleteAllChanGroups",
                                        "ost7720_createChannelGroup", "ost7720_createChannelGroup",
                                        "ost7720_createChannelGroup", "ost7720_createChannelGroup"}));
    EXPECT_EQ(sim::call_log()[1].args.at(0), "\"VXI0::16::INSTR\"");
    using namespace global;
    EXPECT_NE(session, 0);
    EXPECT_EQ(input_ids, (std::vector<int32_t>{1, 2, 3, 4, 0}));
    EXPECT_EQ(source_ids, (std::vector<int32_t>{4097, 4098, 0}));
    EXPECT_EQ(all_ids, (std::vector<int32_t>{1, 2, 3, 4, 4097, 4098, 0}));
    Texts group_sizes;  // inputs, sources, tachs, all
    for (const sim::Call& c : sim::call_log())
        if (c.name == "ost7720_createChannelGroup")
            group_sizes.push_back(c.args.at(1));
    EXPECT_EQ(group_sizes, (Texts{"4", "2", "0", "6"}));
    EXPECT_TRUE(messages.empty());
    EXPECT_TRUE(main().isVisible());

    // Taken in again, both modules are listed from the last found to the first.
    main().VxiBtn_Click();
    EXPECT_EQ(page.UseCkbx[1]->text().toStdString(), "Inactive");
    click(page.UseCkbx[1]);
    sim::clear_call_log();
    click(page.doneBtn);
    EXPECT_EQ(sim::call_log()[1].args.at(0), "\"VXI0::16,8::INSTR\"");
    EXPECT_EQ(global::num_inputs, 12);
}

TEST_F(VxiFrmTest, OkShowsWaitWithTheBusyCursorWhileTheSessionReopens) {
    VxiFrm& page = open({{8, 8, 1, 2, 8}});
    // A failing init raises its report in the middle of the re-open: look at the button then.
    sim::fail("ost7720_init", -1074003951, 1);
    std::string caption;
    Qt::CursorShape cursor = Qt::ArrowCursor;
    dialogs::set_responder([&](dialogs::Kind, const std::string&) {
        caption = page.doneBtn->text().toStdString();
        cursor = page.doneBtn->cursor().shape();
        return dialogs::Answer::yes;
    });
    click(page.doneBtn);
    EXPECT_EQ(caption, "WAIT");
    EXPECT_EQ(cursor, Qt::WaitCursor);
    EXPECT_EQ(page.doneBtn->text().toStdString(), "OK");
    EXPECT_FALSE(page.doneBtn->testAttribute(Qt::WA_SetCursor));
    EXPECT_TRUE(main().isVisible());
}

TEST_F(VxiFrmTest, AllModulesUncheckedOpensNoSessionAndThePanelGoesOn) {
    VxiFrm& page = open({{8, 8, 1, 2, 8}});
    sim::clear_call_log();
    click(page.UseCkbx[1]);
    click(page.doneBtn);
    const Texts names = sim::call_names();
    EXPECT_EQ(std::count(names.begin(), names.end(), "ost7720_init"), 0);
    EXPECT_EQ(global::session, 0);
    EXPECT_EQ(global::num_inputs, 0);
    // Whatever the driver answers for no session is reported, and Go goes on.
    for (const Message& m : messages)
        EXPECT_EQ(m.kind, dialogs::Kind::question) << m.text;
    main().GoBtn_Click();
    main().stop_measurement();
    EXPECT_TRUE(main().isVisible());

    main().VxiBtn_Click();
    click(page.UseCkbx[1]);
    click(page.doneBtn);
    EXPECT_NE(global::session, 0);
    EXPECT_EQ(global::num_inputs, 8);
}

}  // namespace
