// The call log, the trace file, failure injection and the error texts.
#include <unistd.h>

#include <cstdio>
#include <fstream>

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

}  // namespace

TEST(SimTrace, EveryCallAppendsOneLineInTheTraceForm) {
    const std::string path = testing::TempDir() + "sim_trace_" + std::to_string(getpid()) + ".txt";
    std::remove(path.c_str());
    {
        EnvVar env("OST7720_SIM_TRACE", path.c_str());
        sim::reset();
        int32_t s = 0, g = 0, bs = 0;
        double level = 0;
        char text[100];
        const int32_t ids[3] = {1, 2, 3};
        ost7720_init("VXI0::16,8::INSTR", 1, 1, &s);
        ost7720_createChannelGroup(s, 3, ids, &g);
        ost7720_setBlocksize(s, g, 1000);
        ost7720_getBlocksize(s, g, &bs);
        ost7720_setSpan(s, 1, 15000.5);
        ost7720_setRange(s, 1, 0.1);
        ost7720_setTriggerLevel(s, 1, 416, -12.25);
        ost7720_getTriggerLevel(s, 1, 416, &level);
        ost7720_setSpan(s, 1, 1e21);
        ost7720_errorDetails(s, text, 100);
        ost7720_initA("VXI0::8::INSTR   ", 1, 1, &s);
        EXPECT_EQ(read_lines(path).size(), 11u);  // on file as soon as each call returns
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
    simtest::find();
    int32_t s = simtest::open_both();
    ost7720_close(s);
    ost7720_close(s);
    const auto& log = sim::call_log();
    ASSERT_EQ(log.size(), 4u);
    EXPECT_EQ(log[0].args, (std::vector<std::string>{"0", "50", "10"}));
    EXPECT_EQ(log[0].outs, (std::vector<std::string>{"[2]", "2", "\"VXI0\""}));
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
    EXPECT_EQ(simtest::get(ost7720_getBlocksize, s, 1), 1024);
    EXPECT_EQ(ost7720_setBlocksize(s, 1, 4096), 0);
    EXPECT_EQ(simtest::get(ost7720_getBlocksize, s, 1), 4096);

    sim::fail("ost7720_getSpan", sim::err_no_data);
    double span = -1;
    for (int i = 0; i < 5; ++i)
        EXPECT_EQ(ost7720_getSpan(s, 1, &span), sim::err_no_data);
    EXPECT_EQ(span, -1);  // no out-value written
    EXPECT_EQ(sim::call_log().back().line(), "ost7720_getSpan(" + std::to_string(s) + ", 1) -> -1302");
    sim::clear_failures();
    EXPECT_EQ(ost7720_getSpan(s, 1, &span), 0);
    EXPECT_EQ(span, 20000);
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
    for (const char* value : {"ost7720_nothing:-5", "ost7720_close", "ost7720_close:x", "ost7720_close:-5:0",
                              "ost7720_close:-5:1:2", "ost7720_close:-5,", "ost7720_close:99999999999"}) {
        EnvVar env("OST7720_SIM_FAIL", value);
        sim::reset_from_environment();
        EXPECT_EQ(simtest::find().status, sim::err_configuration) << value;
        EXPECT_NE(details(0).find("OST7720_SIM_FAIL: failure"), std::string::npos) << details(0);
    }
    sim::reset();
}

TEST(SimErrors, EveryStatusHasATextAndTextsFitTheirBuffers) {
    sim::reset();
    int32_t s = simtest::open_both();
    char msg[300];
    const std::pair<int32_t, const char*> texts[] = {{0, "No error"},
                                                     {-77, "Unknown error code -77"},
                                                     {12, "Unknown warning code 12"},
                                                     {INT32_MIN, "Unknown error code -2147483648"}};
    for (const auto& [status, text] : texts) {
        ASSERT_EQ(ost7720_error_message(s, status, msg), 0);
        EXPECT_STREQ(msg, text);
    }
    // Every error text fits the 250-character discovery buffer.
    for (int32_t status = -2000; status <= 10; ++status) {
        std::memset(msg, '#', sizeof msg);
        ASSERT_EQ(ost7720_error_message(0, status, msg), 0);
        ASSERT_LE(std::strlen(msg), 249u) << status;
        ASSERT_EQ(std::string(msg + 256, 44), std::string(44, '#')) << status;
    }

    ost7720_setSpan(s, 1, 30000);
    char buf[40];
    std::memset(buf, '#', sizeof buf);
    ASSERT_EQ(ost7720_errorDetails(s, buf, 10), 0);
    EXPECT_STREQ(buf, "ost7720_s");
    EXPECT_EQ(std::string(buf + 10, 30), std::string(30, '#'));
    ASSERT_EQ(ost7720_errorDetails(s, buf, 1), 0);
    EXPECT_STREQ(buf, "");
    EXPECT_EQ(buf[1], 's');
    buf[0] = '#';
    EXPECT_EQ(ost7720_errorDetails(s, buf, 0), sim::err_invalid_count);
    EXPECT_EQ(buf[0], '#');
    EXPECT_EQ(ost7720_errorDetails(s, nullptr, 100), sim::err_null_pointer);
}
