// The simulated system: discovery, the environment, resource strings, sessions and channel groups.
#include <set>

#include "sim_test_util.h"

using simtest::details;
using simtest::EnvVar;
using simtest::find;
using simtest::Found;
using simtest::get;

namespace {

std::string numbered_modules(int count, int step, const char* rest) {
    std::string text;
    for (int i = 1; i <= count; ++i)
        text += (i > 1 ? "," : "") + std::to_string(i * step) + rest;
    return text;
}

}  // namespace

TEST(SimDiscovery, FindsModulesInAddressOrderWithinTheCallersBuffers) {
    sim::reset({{200, 4, 0, 0, 16}, {16, 8, 1, 0, 32}, {8, 8, 1, 2, 8}});
    Found f = find();
    ASSERT_EQ(f.status, 0);
    EXPECT_EQ(f.count, 3);
    EXPECT_EQ(f.head(4), (std::vector<int32_t>{8, 16, 200, -7}));
    EXPECT_EQ(f.iface, "VXI0");
    EXPECT_TRUE(f.iface_tail_untouched);
    Found two = find(2);
    EXPECT_EQ(two.count, 2);
    EXPECT_EQ(two.head(3), (std::vector<int32_t>{8, 16, -7}));
}

TEST(SimDiscovery, EnvironmentDescribesTheSystem) {
    const std::string sixteen = numbered_modules(16, 10, ":8:1:0:4");
    const struct {
        const char* value;
        int32_t count, last;
    } cases[] = {{nullptr, 2, 16}, {"", 0, -7}, {sixteen.c_str(), 16, 160}};
    for (const auto& c : cases) {
        EnvVar env("OST7720_SIM_MODULES", c.value);
        sim::reset_from_environment();
        Found f = find();
        EXPECT_EQ(f.status, 0);
        EXPECT_EQ(f.count, c.count);
        EXPECT_EQ(f.addresses[static_cast<size_t>(std::max(c.count - 1, 0))], c.last);
    }
    int32_t s = 0;  // modules 160 and 10 of the sixteen
    ASSERT_EQ(ost7720_init("VXI0::160,10::INSTR", 1, 1, &s), 0);
    EXPECT_EQ(simtest::channel_counts(s), (std::vector<int32_t>{18, 16, 2, 0}));
    sim::reset();
}

TEST(SimDiscovery, MalformedEnvironmentMakesFindFailWithTheReason) {
    const std::string fifty_one = numbered_modules(51, 1, ":1:0:0:1");
    // clang-format off
    const struct { std::string value; const char* reason; } cases[] = {
        {"8:8:1:2", "expected address:inputs:sources:tachs:megabytes"}, {"8:8:1:2:8:1", "expected address"},
        {"8:8:1:2:8,", "module 2"}, {"x:8:1:2:8", "address \"x\" is not a whole number"},
        {"8:8:1:2:-8", "megabytes \"-8\""}, {" 8:8:1:2:8", "address \" 8\""},
        {"99999999999999999999:8:1:2:8", "not a whole number"}, {"0:8:1:2:8", "address 0 not in 1..255"},
        {"256:8:1:2:8", "address 256"}, {"8:65:1:2:8", "inputs 65"}, {"8:8:9:2:8", "sources 9"},
        {"8:8:1:9:8", "tachs"}, {"8:8:1:2:0", "megabytes 0"}, {"8:8:1:2:8,8:4:0:0:8", "address 8 used twice"},
        {"8:8:1:2:8;16:8:1:0:32", "expected"}, {fifty_one, "more than 50 modules"}};
    // clang-format on
    for (const auto& c : cases) {
        SCOPED_TRACE(c.value);
        EnvVar env("OST7720_SIM_MODULES", c.value.c_str());
        sim::reset_from_environment();
        EXPECT_EQ(find().status, sim::err_configuration);
        EXPECT_NE(details(0).find("ost7720_find: OST7720_SIM_MODULES"), std::string::npos) << details(0);
        EXPECT_NE(details(0).find(c.reason), std::string::npos) << details(0);
        int32_t s = 99;
        EXPECT_LT(ost7720_initA("VXI0::8::INSTR", 1, 1, &s), 0);
        EXPECT_EQ(s, 0);
    }
    sim::reset();
}

TEST(SimDiscovery, ResourceStringsAreParsedStrictly) {
    sim::reset();
    const std::string huge(5000, '8');
    const int32_t syntax = sim::err_resource_syntax, not_found = sim::err_resource_not_found;
    // clang-format off
    const struct { const char* resource; int32_t status; const char* reason; } cases[] = {
        {"", syntax, "ost7720_init: empty resource string"},
        {"VXI1::8::INSTR", not_found, "unknown interface \"VXI1\""},
        {"vxi0::8::INSTR", not_found, "unknown interface"},
        {"VXI0::9::INSTR", not_found, "no module at address 9"},
        {"VXI0::16,24::INSTR", not_found, "no module at address 24"},
        {"VXI0::8::INST", syntax, "does not end in ::INSTR"}, {"VXI0::8::INSTR ", syntax, "::INSTR"},
        {"VXI0:8::INSTR", syntax, "is not interface::address::INSTR"}, {"VXI0::08::INSTR", syntax, "\"08\""},
        {"VXI0:: 8::INSTR", syntax, "address \" 8\""}, {"VXI0::::INSTR", syntax, "address \"\""},
        {"VXI0::256::INSTR", syntax, "not a number 1..255"}, {"VXI0::8::9::INSTR", syntax, "\"8::9\""},
        {"VXI0::16,8,16::INSTR", syntax, "address 16 repeated"}, {"VXI0::16,8,::INSTR", syntax, "\"\""},
        {huge.c_str(), syntax, "resource string too long"}};
    // clang-format on
    for (const auto& c : cases) {
        SCOPED_TRACE(std::string(c.resource).substr(0, 40));
        int32_t s = 77;
        EXPECT_EQ(ost7720_init(c.resource, 1, 1, &s), c.status);
        EXPECT_EQ(s, 0);
        EXPECT_NE(details(0).find(c.reason), std::string::npos) << details(0);
    }
    // The staged calls parse the same way and open single modules only.
    int32_t s = 77;
    EXPECT_EQ(ost7720_initA("VXI0::08::INSTR", 1, 1, &s), syntax);
    EXPECT_EQ(ost7720_initA("VXI0::16,8::INSTR", 1, 1, &s), syntax);
    EXPECT_NE(details(0).find("ost7720_initA: opens one module"), std::string::npos) << details(0);
    EXPECT_EQ(s, 0);
    EXPECT_EQ(ost7720_init(nullptr, 1, 1, &s), sim::err_null_pointer);
    EXPECT_EQ(s, 0);
    EXPECT_EQ(ost7720_init("VXI0::8::INSTR", 1, 1, nullptr), sim::err_null_pointer);
    ASSERT_EQ(ost7720_initA("VXI0::8::INSTR", 1, 1, &s), 0);
    EXPECT_NE(s, 0);
}

TEST(SimDiscovery, ResourceListOrderFixesChannelNumbering) {
    sim::reset();
    int32_t both = simtest::open_both(), m16 = 0, m8 = 0;
    EXPECT_EQ(simtest::channel_counts(both), (std::vector<int32_t>{20, 16, 2, 2}));
    ASSERT_EQ(ost7720_initC("VXI0::16::INSTR", 1, 0, &m16), 0);
    ASSERT_EQ(ost7720_initC("VXI0::8::INSTR", 1, 0, &m8), 0);
    // Input 1 of the list is input 1 of module 16, input 9 input 1 of module 8; source 4098 is
    // module 8's; the tachometers are module 8's only.
    ASSERT_EQ(ost7720_setRange(both, 1, 5.0), 0);
    ASSERT_EQ(ost7720_setRange(both, 9, 0.5), 0);
    ASSERT_EQ(ost7720_setSineFreq(both, 4098, 250.0), 0);
    ASSERT_EQ(ost7720_setTriggerChannel(both, 8194, 420), 0);
    EXPECT_EQ(get(ost7720_getRange, m16, 1), 5.0);
    EXPECT_EQ(get(ost7720_getRange, m8, 1), 0.5);
    EXPECT_EQ(get(ost7720_getSineFreq, m8, 4097), 250.0);
    EXPECT_EQ(get(ost7720_getTriggerChannel, m8, 8194), 420);
    int32_t trig = 0;
    EXPECT_EQ(ost7720_getTriggerChannel(m8, 8195, &trig), sim::err_invalid_channel);
    EXPECT_EQ(ost7720_getTriggerChannel(m16, 8193, &trig), sim::err_invalid_channel);
}

TEST(SimDiscovery, HardwareConfigurationAnswersWithoutASession) {
    sim::reset({{8, 8, 1, 2, 8}, {16, 8, 1, 0, 32}, {30, 64, 0, 0, 1}});
    std::vector<int32_t> r(27 * 3 + 1, -3), one(28, -3);
    const int32_t addresses[3] = {16, 8, 30}, unknown[1] = {9};
    ASSERT_EQ(ost7720_getHWConfig(0, 3, addresses, r.data()), 0);
    // Address; memory in units of 262144 per MB; inputs and tachometers of module 8; the largest
    // block 1 MB holds for 64 inputs; nothing past the three records.
    EXPECT_EQ((std::vector<int32_t>{r[0], r[25], r[27 + 25], r[27 + 6], r[27 + 8], r[54 + 20], r[81]}),
              (std::vector<int32_t>{16, 32 * 262144, 2097152, 8, 2, 2048, -3}));
    EXPECT_EQ(ost7720_getHWConfig(0, 1, unknown, one.data()), sim::err_resource_not_found);
    EXPECT_NE(details(0).find("no module at address 9"), std::string::npos);
    EXPECT_EQ(one[0], -3);
    EXPECT_EQ(ost7720_getHWConfig(0, -1, addresses, one.data()), sim::err_invalid_count);
    EXPECT_EQ(ost7720_getHWConfig(0, 1, addresses, nullptr), sim::err_null_pointer);
    int32_t s = simtest::open_both();
    EXPECT_EQ(ost7720_getHWConfig(s, 1, addresses, one.data()), 0);
    EXPECT_EQ(one[27], -3);
    ASSERT_EQ(ost7720_close(s), 0);
    EXPECT_EQ(ost7720_getHWConfig(s, 1, addresses, one.data()), sim::err_invalid_session);
}

TEST(SimSessions, HandlesAreNonZeroUniqueAndRefusedOnceClosed) {
    sim::reset();
    int32_t a = simtest::open_both(), b = simtest::open_both(), total, inputs, sources, tachs;
    EXPECT_NE(a, 0);
    EXPECT_NE(a, b);
    ASSERT_EQ(ost7720_close(a), 0);
    EXPECT_EQ(ost7720_getNumChans(a, &total, &inputs, &sources, &tachs), sim::err_invalid_session);
    EXPECT_EQ(details(a), "ost7720_getNumChans: session " + std::to_string(a) + " is not open");
    EXPECT_EQ(ost7720_close(a), sim::err_invalid_session);
    EXPECT_EQ(ost7720_setBlocksize(12345, 1, 1024), sim::err_invalid_session);
    EXPECT_EQ(simtest::channel_counts(b)[0], 20);
    int32_t c = simtest::open_both();  // never the closed handle again
    EXPECT_NE(c, a);
    EXPECT_NE(c, b);

    // The staged calls continue one session; each alone opens one of its own.
    int32_t x = 0, y = 0, z = 0;
    ASSERT_EQ(ost7720_initA("VXI0::8::INSTR", 1, 1, &x), 0);
    ASSERT_EQ(ost7720_initB3("VXI0::8::INSTR", 1, 1, &y), 0);
    ASSERT_EQ(ost7720_initC("VXI0::8::INSTR", 1, 1, &z), 0);
    EXPECT_EQ(x, y);
    EXPECT_EQ(y, z);
    EXPECT_EQ(simtest::channel_counts(z), (std::vector<int32_t>{11, 8, 1, 2}));
    ASSERT_EQ(ost7720_close(z), 0);
    EXPECT_EQ(ost7720_close(x), sim::err_invalid_session);
    ASSERT_EQ(ost7720_initC("VXI0::16::INSTR", 1, 1, &x), 0);
    ASSERT_EQ(ost7720_initC("VXI0::16::INSTR", 1, 1, &y), 0);
    EXPECT_NE(x, y);
}

TEST(SimSessions, HandleZeroIsRefusedWhereASessionIsNeeded) {
    sim::reset();
    int32_t total = -1, inputs, sources, tachs, group = -1;
    EXPECT_EQ(ost7720_getNumChans(0, &total, &inputs, &sources, &tachs), sim::err_no_session);
    EXPECT_EQ(total, -1);
    EXPECT_EQ(details(0), "ost7720_getNumChans: session handle 0: no session is open");
    EXPECT_EQ(ost7720_deleteAllChanGroups(0), sim::err_no_session);
    EXPECT_EQ(ost7720_createChannelGroup(0, 0, nullptr, &group), sim::err_no_session);
    EXPECT_EQ(group, -1);
    EXPECT_EQ(ost7720_close(0), sim::err_no_session);

    // The revision and error texts answer without a session, within 255 and 256 characters.
    char drv[300], fw[300], msg[256];
    std::memset(drv, '#', sizeof drv);
    EXPECT_EQ(ost7720_revision_query(0, drv, fw), 0);
    EXPECT_GT(std::strlen(drv), 0u);
    EXPECT_EQ(std::string(drv + 255, 45), std::string(45, '#'));
    EXPECT_EQ(ost7720_error_message(0, sim::err_no_session, msg), 0);
    EXPECT_STREQ(msg, "The call needs an open session");
}

TEST(SimGroups, IdsAreUniqueAndNeverChannelIds) {
    sim::reset();
    int32_t s = simtest::open_both(), s2 = simtest::open_both(), g = 0;
    std::set<int32_t> ids;
    const int32_t members[2] = {1, 2};
    for (int i = 0; i < 15; ++i) {
        ASSERT_EQ(ost7720_createChannelGroup(i % 2 ? s : s2, i % 3, members, &g), 0);
        EXPECT_GE(g, 0x10000);
        EXPECT_TRUE(ids.insert(g).second) << g;
        if (i % 5 == 4)
            ost7720_deleteAllChanGroups(s);
    }
}

TEST(SimGroups, AGroupAppliesToEveryMemberAndReadsItsFirst) {
    sim::reset();
    int32_t s = simtest::open_both(), other = simtest::open_both(), g = 0, empty = 0, active = 0;
    const int32_t members[3] = {3, 1, 3};
    ASSERT_EQ(ost7720_createChannelGroup(s, 3, members, &g), 0);
    ASSERT_EQ(ost7720_createChannelGroup(s, 0, nullptr, &empty), 0);
    EXPECT_NE(empty, 0);
    ASSERT_EQ(ost7720_setCoupling(s, 3, 101), 0);
    ASSERT_EQ(ost7720_setCoupling(s, 1, 100), 0);
    EXPECT_EQ(get(ost7720_getCoupling, s, g), 101);  // member 3 comes first
    ASSERT_EQ(ost7720_setRange(s, g, 0.5), 0);
    EXPECT_EQ(get(ost7720_getRange, s, 1), 0.5);
    EXPECT_EQ(get(ost7720_getRange, s, 3), 0.5);
    EXPECT_EQ(get(ost7720_getRange, s, 2), 2.0);

    // An empty group takes settings (nothing to do) but has nothing to read.
    EXPECT_EQ(ost7720_setActive(s, empty, 421), 0);
    EXPECT_EQ(ost7720_getActive(s, empty, &active), sim::err_invalid_channel);
    EXPECT_EQ(details(s), "ost7720_getActive: group " + std::to_string(empty) + " is empty");

    // Groups belong to their session and go with deleteAllChanGroups.
    EXPECT_EQ(ost7720_setRange(other, g, 1.0), sim::err_invalid_channel);
    ASSERT_EQ(ost7720_deleteAllChanGroups(s), 0);
    EXPECT_EQ(ost7720_setRange(s, g, 1.0), sim::err_invalid_channel);
    EXPECT_EQ(details(s),
              "ost7720_setRange: channel " + std::to_string(g) + " is not in session " + std::to_string(s));
}

TEST(SimGroups, BadMembersAndMixedKindsAreRefusedWholly) {
    sim::reset();
    int32_t s = simtest::open_both(), g = -5;
    const int32_t bad[3] = {1, 17, 2}, past_sources[1] = {4099}, mixed[2] = {1, 4097};
    EXPECT_EQ(ost7720_createChannelGroup(s, 3, bad, &g), sim::err_invalid_channel);
    EXPECT_EQ(g, -5);
    EXPECT_EQ(details(s), "ost7720_createChannelGroup: channel 17 is not in session " + std::to_string(s));
    EXPECT_EQ(ost7720_createChannelGroup(s, 1, past_sources, &g), sim::err_invalid_channel);
    EXPECT_EQ(ost7720_createChannelGroup(s, -1, bad, &g), sim::err_invalid_count);
    EXPECT_EQ(ost7720_createChannelGroup(s, 2, nullptr, &g), sim::err_null_pointer);
    EXPECT_EQ(ost7720_createChannelGroup(s, 0, nullptr, nullptr), sim::err_null_pointer);

    // An input-only setting on an input and a source changes nothing; one both kinds have applies.
    ASSERT_EQ(ost7720_createChannelGroup(s, 2, mixed, &g), 0);
    EXPECT_EQ(ost7720_setCoupling(s, g, 100), sim::err_wrong_channel_type);
    EXPECT_EQ(details(s), "ost7720_setCoupling: channel 4097 is a source; the call takes inputs");
    EXPECT_EQ(get(ost7720_getCoupling, s, 1), 101);
    EXPECT_EQ(ost7720_setActive(s, g, 421), 0);
    EXPECT_EQ(get(ost7720_getActive, s, 4097), 421);
}
