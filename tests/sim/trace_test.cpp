// The call log, the trace file and failure injection.
#include <gtest/gtest.h>

#include <unistd.h>
#include <cstdint>
#include <cstdio>
#include <cstring>
#include <fstream>
#include <string>
#include <vector>

#include "errors.h"
#include "sim_test_util.h"

using simtest::details;
using simtest::EnvVar;

namespace {

std::vector<std::string> read_lines(const std::string& path) {
    std::vector<std::string> lines;
    std::ifstream in(path);
    for (std::string line; std::getline(in, line);)
        lines.push_back(line);
    return lines;
}

std::string temp_path(const char* name) {
    return testing::TempDir() + name + std::to_string(getpid()) + ".txt";
}

}  // namespace

TEST(SimTrace, EveryCallAppendsOneLineInTheTraceForm) {
    std::string path = temp_path("sim_trace_");
    std::remove(path.c_str());
    {
        EnvVar env("OST7720_SIM_TRACE", path.c_str());
        sim::reset();
        int32_t s = 0;
        ost7720_init("VXI0::16,8::INSTR", 1, 1, &s);
        int32_t g = 0;
        const int32_t ids[3] = {1, 2, 3};
        ost7720_createChannelGroup(s, 3, ids, &g);
        ost7720_setBlocksize(s, g, 1000);
        int32_t bs = 0;
        ost7720_getBlocksize(s, g, &bs);
        ost7720_setSpan(s, 1, 15000.5);
        ost7720_setRange(s, 1, 0.1);
        double level = 0;
        ost7720_setTriggerLevel(s, 1, 416, -12.25);
        ost7720_getTriggerLevel(s, 1, 416, &level);
        ost7720_setSpan(s, 1, 1e21);
        char text[100];
        ost7720_errorDetails(s, text, 100);
        ost7720_initA("VXI0::8::INSTR   ", 1, 1, &s);
        // The file has every line as soon as the call returns.
        EXPECT_EQ(read_lines(path).size(), 11u);
    }
    sim::reset();
    const std::vector<std::string> expected = {
        "ost7720_init(\"VXI0::16,8::INSTR\", 1, 1) -> 0 => 1",
        "ost7720_createChannelGroup(1, 3, [3]) -> 0 => 65536",
        "ost7720_setBlocksize(1, 65536, 1000) -> 0",
        "ost7720_getBlocksize(1, 65536) -> 0 => 1024",
        "ost7720_setSpan(1, 1, 15000.5) -> 0",
        "ost7720_setRange(1, 1, 0.1) -> 0",
        "ost7720_setTriggerLevel(1, 1, 416, -12.25) -> 0",
        "ost7720_getTriggerLevel(1, 1, 416) -> 0 => -12.25",
        "ost7720_setSpan(1, 1, 1e+21) -> -1105",
        "ost7720_errorDetails(1, 100) -> 0 => \"ost7720_setSpan: span 1e+21 Hz above the maximum 20000 Hz\"",
        "ost7720_initA(\"VXI0::8::INSTR\", 1, 1) -> -1201 => 0",
    };
    EXPECT_EQ(read_lines(path), expected);
    std::remove(path.c_str());
}

TEST(SimTrace, TheLogKeepsNameArgumentsOutValuesAndStatus) {
    sim::reset();
    int32_t addresses[50], found = 0;
    char iface[50];
    ost7720_find(0, addresses, 50, &found, iface, 10);
    int32_t s = simtest::open_both();
    ost7720_close(s);
    ost7720_close(s);
    const auto& log = sim::call_log();
    ASSERT_EQ(log.size(), 4u);
    EXPECT_EQ(log[0].name, "ost7720_find");
    EXPECT_EQ(log[0].args, (std::vector<std::string>{"0", "50", "10"}));
    EXPECT_EQ(log[0].outs, (std::vector<std::string>{"[2]", "2", "\"VXI0\""}));
    EXPECT_EQ(log[0].status, 0);
    EXPECT_EQ(log[3].line(), "ost7720_close(1) -> -1101");
    EXPECT_EQ(sim::call_names(),
              (std::vector<std::string>{"ost7720_find", "ost7720_init", "ost7720_close", "ost7720_close"}));
    sim::clear_call_log();
    EXPECT_TRUE(sim::call_log().empty());
}

TEST(SimFailures, InjectedFailuresCountDownOrLastAndDoNotAct) {
    sim::reset();
    int32_t s = simtest::open_both();
    sim::fail("ost7720_setBlocksize", -77, 2);
    EXPECT_EQ(ost7720_setBlocksize(s, 1, 4096), -77);
    EXPECT_EQ(details(s), "ost7720_setBlocksize: simulated failure (status -77)");
    EXPECT_EQ(ost7720_setBlocksize(s, 1, 4096), -77);
    int32_t bs = 0;
    ost7720_getBlocksize(s, 1, &bs);
    EXPECT_EQ(bs, 1024);
    EXPECT_EQ(ost7720_setBlocksize(s, 1, 4096), 0);
    ost7720_getBlocksize(s, 1, &bs);
    EXPECT_EQ(bs, 4096);

    sim::fail("ost7720_getSpan", sim::err_no_data);
    double span = -1;
    for (int i = 0; i < 5; ++i)
        EXPECT_EQ(ost7720_getSpan(s, 1, &span), sim::err_no_data);
    EXPECT_EQ(span, -1);  // no out-value written
    const sim::Call& last = sim::call_log().back();
    EXPECT_EQ(last.line(), "ost7720_getSpan(" + std::to_string(s) + ", 1) -> -1302");
    sim::clear_failures();
    EXPECT_EQ(ost7720_getSpan(s, 1, &span), 0);
    EXPECT_EQ(span, 20000);

    char msg[256];
    ASSERT_EQ(ost7720_error_message(s, -77, msg), 0);
    EXPECT_STREQ(msg, "Unknown error code -77");
    ASSERT_EQ(ost7720_error_message(s, 0, msg), 0);
    EXPECT_STREQ(msg, "No error");
    ASSERT_EQ(ost7720_error_message(s, 12, msg), 0);
    EXPECT_STREQ(msg, "Unknown warning code 12");
    ASSERT_EQ(ost7720_error_message(s, INT32_MIN, msg), 0);
    EXPECT_STREQ(msg, "Unknown error code -2147483648");
}

TEST(SimFailures, EnvironmentListAndItsErrors) {
    {
        EnvVar env("OST7720_SIM_FAIL", "ost7720_getSpan:-5:1,ost7720_close:-9");
        sim::reset_from_environment();
        int32_t s = simtest::open_both();
        double span = 0;
        EXPECT_EQ(ost7720_getSpan(s, 1, &span), -5);
        EXPECT_EQ(ost7720_getSpan(s, 1, &span), 0);
        EXPECT_EQ(ost7720_close(s), -9);
        EXPECT_EQ(ost7720_close(s), -9);
    }
    const char* bad[] = {"ost7720_nothing:-5",       "ost7720_close",        "ost7720_close:x",
                         "ost7720_close:-5:0",       "ost7720_close:-5:1:2", "ost7720_close:-5,",
                         "ost7720_close:99999999999"};
    for (const char* value : bad) {
        EnvVar env("OST7720_SIM_FAIL", value);
        sim::reset_from_environment();
        int32_t addresses[50], found = 0;
        char iface[50];
        EXPECT_EQ(ost7720_find(0, addresses, 50, &found, iface, 10), sim::err_configuration) << value;
        EXPECT_NE(details(0).find("OST7720_SIM_FAIL: failure"), std::string::npos) << details(0);
    }
    sim::reset();
}

TEST(SimErrors, TextsFitTheirBuffers) {
    sim::reset();
    int32_t s = simtest::open_both();
    ost7720_setSpan(s, 1, 30000);
    char buf[40];
    std::memset(buf, '#', sizeof buf);
    ASSERT_EQ(ost7720_errorDetails(s, buf, 10), 0);
    EXPECT_STREQ(buf, "ost7720_s");
    for (size_t i = 10; i < sizeof buf; ++i)
        ASSERT_EQ(buf[i], '#');
    ASSERT_EQ(ost7720_errorDetails(s, buf, 1), 0);
    EXPECT_STREQ(buf, "");
    EXPECT_EQ(buf[1], 's');
    buf[0] = '#';
    EXPECT_EQ(ost7720_errorDetails(s, buf, 0), sim::err_invalid_count);
    EXPECT_EQ(buf[0], '#');
    EXPECT_EQ(ost7720_errorDetails(s, nullptr, 100), sim::err_null_pointer);

    // Every error text fits the 250-character discovery buffer.
    char msg[300];
    for (int32_t status = -2000; status <= 10; ++status) {
        std::memset(msg, '#', sizeof msg);
        ASSERT_EQ(ost7720_error_message(0, status, msg), 0);
        ASSERT_LE(std::strlen(msg), 249u) << status;
        for (size_t i = 256; i < sizeof msg; ++i)
            ASSERT_EQ(msg[i], '#');
    }
}
