// The driver-error report, the cleaning of driver texts, and the end of the program.
#include <gtest/gtest.h>

#include <QTest>

#include "core/global.h"
#include "core/shutdown.h"
#include "core/windows.h"
#include "display/MainFrm.h"
#include "ost7720.h"
#include "panel_fixture.h"

namespace {

using Names = std::vector<std::string>;

TEST(CleanDriverText, KeepsTextBeforeNulMakesControlsBlanksAndTrims) {
    const std::vector<std::pair<std::string, std::string>> cases = {
        {std::string("  Invalid session\0      ", 24), "Invalid session"},
        {std::string("a\tb\nc\rd\r\n\0", 10), "a b c d"},   // controls at the end trimmed too
        {std::string("caf\xc3\xa9\x7f!\0", 8), "caf   !"},  // non-ASCII and DEL
        {"no terminator", ""},
        {std::string("\0after", 6), ""},
        {std::string("   \0", 4), ""},
        {std::string("x\0y\0", 4), "x"},
    };
    for (auto [text, expected] : cases) {
        SCOPED_TRACE(expected);
        clean_driver_text(text);
        EXPECT_EQ(text, expected);
    }
}

class DriverErrorTest : public PanelTest {};

TEST_F(DriverErrorTest, ReportShowsNameCodeTextAndDetailsAndYesReturns) {
    // A refused setting leaves details behind; the report shows them on their own line.
    ASSERT_EQ(ost7720_init("VXI0::8::INSTR", 1, 1, &global::session), 0);
    const int32_t code = ost7720_setBlocksize(global::session, 1, -5);
    ASSERT_LT(code, 0);
    std::string text(256, ' '), details(100, ' ');
    ost7720_error_message(0, code, text.data());
    ost7720_errorDetails(global::session, details.data(), 100);
    clean_driver_text(text);
    clean_driver_text(details);
    ASSERT_FALSE(details.empty());

    report_driver_error("ost7720_setBlocksize", code);
    // The report asks the driver for its text and details with the panel's session.
    const auto names = sim::call_names();
    ASSERT_GE(names.size(), 2u);
    EXPECT_EQ(Names(names.end() - 2, names.end()), (Names{"ost7720_error_message", "ost7720_errorDetails"}));
    ASSERT_EQ(messages.size(), 1u);
    EXPECT_EQ(messages[0].kind, dialogs::Kind::question);
    EXPECT_EQ(messages[0].text,
              "The Ostrana K7720 Plug&Play library has reported an error\r\n"
              "ost7720_32.dll: ost7720_setBlocksize returned " +
                  std::to_string(code) + " " + text + "\r\n" + details +
                  "\r\n\r\nPress Yes to continue or No to exit the Soft Front Panel");

    // Without the driver's texts the report still shows.
    messages.clear();
    sim::fail("ost7720_error_message", -1);
    sim::fail("ost7720_errorDetails", -1);
    report_driver_error("ost7720_close", -1074000000);
    ASSERT_EQ(messages.size(), 1u);
    EXPECT_EQ(messages[0].text.rfind("The Ostrana K7720 Plug&Play library has reported an error\r\n"
                                     "ost7720_32.dll: ost7720_close returned -1074000000 ",
                                     0),
              0u);
}

TEST_F(DriverErrorTest, NoEndsTheProgramAtOnce) {
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    EXPECT_EXIT(
        {
            answer(dialogs::Answer::no);
            report_driver_error("ost7720_getRange", -1);
            fprintf(stderr, "REPORT-RETURNED");
        },
        testing::ExitedWithCode(0), "^$");
}

// Exit and closing the main window close the session and end the program; a failing close
// (or no session: handle 0) is reported first and either answer ends it.
TEST_F(DriverErrorTest, ExitAndCloseCloseTheSessionReportAFailureAndEnd) {
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    MainFrm& main = forms::get<MainFrm>();
    main.Form_Load();
    struct Case {
        const char* name;
        bool by_exit_button, fail_close, no_session;
        dialogs::Answer answer;
        const char* expected;
    };
    const std::vector<Case> cases = {
        {"Exit", true, false, false, dialogs::Answer::yes, "^$"},
        {"close, failing, Yes", false, true, false, dialogs::Answer::yes, "^CLOSE-REPORTED$"},
        {"close, failing, No", false, true, false, dialogs::Answer::no, "^CLOSE-REPORTED$"},
        {"Exit without session", true, false, true, dialogs::Answer::yes, "^CLOSE-REPORTED$"},
    };
    for (const Case& c : cases) {
        EXPECT_EXIT(
            {
                if (c.fail_close)
                    sim::fail("ost7720_close", -1074003951);
                if (c.no_session)
                    global::session = 0;
                dialogs::set_responder([&c](dialogs::Kind, const std::string& text) {
                    const bool close = text.find("ost7720_close returned ") != std::string::npos;
                    fprintf(stderr, "%s", close ? "CLOSE-REPORTED" : "UNEXPECTED-MESSAGE");
                    return c.answer;
                });
                if (c.by_exit_button)
                    QTest::mouseClick(main.ExitBtn, Qt::LeftButton);
                else
                    main.close();
                fprintf(stderr, "RETURNED");
            },
            testing::ExitedWithCode(0), c.expected)
            << c.name;
    }
}

}  // namespace
