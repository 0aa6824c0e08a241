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

std::string cleaned(std::string s) {
    clean_driver_text(s);
    return s;
}

TEST(CleanDriverText, KeepsTextBeforeNulMakesControlsBlanksAndTrims) {
    EXPECT_EQ(cleaned(std::string("  Invalid session\0      ", 24)), "Invalid session");
    EXPECT_EQ(cleaned(std::string("a\tb\nc\rd\0", 8)), "a b c d");
    EXPECT_EQ(cleaned(std::string("caf\xc3\xa9\x7f!\0", 8)), "caf   !");
    EXPECT_EQ(cleaned(std::string("no terminator")), "");
    EXPECT_EQ(cleaned(std::string("\0after", 6)), "");
    EXPECT_EQ(cleaned(std::string("   \0", 4)), "");
    EXPECT_EQ(cleaned(std::string("x\0y\0", 4)), "x");
}

class DriverErrorTest : public PanelTest {};

std::string driver_text(int32_t code) {
    std::string text(256, ' ');
    ost7720_error_message(0, code, text.data());
    clean_driver_text(text);
    return text;
}

TEST_F(DriverErrorTest, ReportShowsNameCodeTextAndDetailsAndYesReturns) {
    // A refused setting leaves details behind; the report shows them on their own line.
    int32_t session = 0;
    ASSERT_EQ(ost7720_init("VXI0::8::INSTR", 1, 1, &session), 0);
    global::session = session;
    const int32_t code = ost7720_setBlocksize(session, 1, -5);
    ASSERT_LT(code, 0);
    std::string details(100, ' ');
    ost7720_errorDetails(session, details.data(), 100);
    clean_driver_text(details);
    ASSERT_FALSE(details.empty());

    report_driver_error("ost7720_setBlocksize", code);
    // The report asks the driver for its text and details with the panel's session.
    const auto names = sim::call_names();
    ASSERT_GE(names.size(), 2u);
    EXPECT_EQ(names[names.size() - 2], "ost7720_error_message");
    EXPECT_EQ(names.back(), "ost7720_errorDetails");
    ASSERT_EQ(messages.size(), 1u);
    EXPECT_EQ(messages[0].kind, dialogs::Kind::question);
    EXPECT_EQ(messages[0].text,
              "The Ostrana K7720 Plug&Play library has reported an error\r\n"
              "ost7720_32.dll: ost7720_setBlocksize returned " +
                  std::to_string(code) + " " + driver_text(code) + "\r\n" + details +
                  "\r\n\r\nPress Yes to continue or No to exit the Soft Front Panel");
}

TEST_F(DriverErrorTest, ReportStillShowsWhenTheTextCallsFail) {
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

TEST_F(DriverErrorTest, ExitClosesTheSessionReportsAFailedCloseAndEnds) {
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    MainFrm& main = forms::get<MainFrm>();
    main.Form_Load();
    EXPECT_EXIT(
        {
            sim::clear_call_log();
            dialogs::set_responder([](dialogs::Kind, const std::string&) {
                fprintf(stderr, "UNEXPECTED-MESSAGE");
                return dialogs::Answer::yes;
            });
            QTest::mouseClick(main.ExitBtn, Qt::LeftButton);
            fprintf(stderr, "EXIT-RETURNED");
        },
        testing::ExitedWithCode(0), "^$");
    // With a failing close, the report comes first and either answer ends the program.
    for (dialogs::Answer a : {dialogs::Answer::yes, dialogs::Answer::no}) {
        EXPECT_EXIT(
            {
                sim::fail("ost7720_close", -1074003951);
                dialogs::set_responder([a](dialogs::Kind, const std::string& text) {
                    if (text.find("ost7720_close returned -1074003951") != std::string::npos)
                        fprintf(stderr, "CLOSE-REPORTED");
                    return a;
                });
                main.close();
                fprintf(stderr, "CLOSE-RETURNED");
            },
            testing::ExitedWithCode(0), "^CLOSE-REPORTED$");
    }
}

TEST_F(DriverErrorTest, ExitWithoutSessionStillCallsCloseWithHandleZero) {
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    EXPECT_EXIT(
        {
            global::session = 0;
            dialogs::set_responder([](dialogs::Kind, const std::string& text) {
                fprintf(stderr, "%s",
                        text.find("ost7720_close returned") != std::string::npos ? "REPORTED" : "");
                return dialogs::Answer::yes;
            });
            forms::get<MainFrm>().ExitBtn_Click();
        },
        testing::ExitedWithCode(0), "^REPORTED$");
}

}  // namespace
