// Discovery, the simulated system from the environment, and resource strings.
#include <gtest/gtest.h>

#include <cstring>
#include <string>
#include <vector>

#include "errors.h"
#include "sim_test_util.h"

using simtest::details;
using simtest::EnvVar;

namespace {

struct Found {
    int32_t status = 0;
    int32_t count = -1;
    std::vector<int32_t> addresses;
    std::string iface;
};

Found find(int32_t max_modules = 50) {
    Found f;
    f.addresses.assign(60, -7);
    char iface[60];
    std::memset(iface, ' ', sizeof iface);
    f.status = ost7720_find(0, f.addresses.data(), max_modules, &f.count, iface, 10);
    if (f.status == 0)
        f.iface = iface;
    return f;
}

}  // namespace

TEST(SimDiscovery, FindsModulesInAddressOrderAndNeverWritesPastTheSlots) {
    sim::reset({{200, 4, 0, 0, 16}, {16, 8, 1, 0, 32}, {8, 8, 1, 2, 8}});
    Found f = find();
    ASSERT_EQ(f.status, 0);
    EXPECT_EQ(f.count, 3);
    EXPECT_EQ(f.addresses[0], 8);
    EXPECT_EQ(f.addresses[1], 16);
    EXPECT_EQ(f.addresses[2], 200);
    EXPECT_EQ(f.addresses[3], -7);
    EXPECT_EQ(f.iface, "VXI0");

    Found two = find(2);
    ASSERT_EQ(two.status, 0);
    EXPECT_EQ(two.count, 2);
    EXPECT_EQ(two.addresses[1], 16);
    EXPECT_EQ(two.addresses[2], -7);

    // The interface name fits the panel's 50-character buffer: nothing after its NUL changes.
    char iface[60];
    std::memset(iface, '#', sizeof iface);
    int32_t addresses[50], count = 0;
    ASSERT_EQ(ost7720_find(0, addresses, 50, &count, iface, 10), 0);
    EXPECT_STREQ(iface, "VXI0");
    for (size_t i = 5; i < sizeof iface; ++i)
        EXPECT_EQ(iface[i], '#') << i;
}

TEST(SimDiscovery, DefaultSystemAndEnvironmentDescriptions) {
    {
        EnvVar env("OST7720_SIM_MODULES", nullptr);
        sim::reset_from_environment();
        Found f = find();
        ASSERT_EQ(f.status, 0);
        ASSERT_EQ(f.count, 2);
        EXPECT_EQ(f.addresses[0], 8);
        EXPECT_EQ(f.addresses[1], 16);
    }
    {
        EnvVar env("OST7720_SIM_MODULES", "");
        sim::reset_from_environment();
        Found f = find();
        EXPECT_EQ(f.status, 0);
        EXPECT_EQ(f.count, 0);
    }
    {
        std::string sixteen;
        for (int i = 1; i <= 16; ++i)
            sixteen += (i > 1 ? "," : "") + std::to_string(i * 10) + ":8:1:0:4";
        EnvVar env("OST7720_SIM_MODULES", sixteen.c_str());
        sim::reset_from_environment();
        Found f = find();
        ASSERT_EQ(f.status, 0);
        ASSERT_EQ(f.count, 16);
        EXPECT_EQ(f.addresses[15], 160);
        int32_t s = 0;
        ASSERT_EQ(ost7720_init("VXI0::160,10::INSTR", 1, 1, &s), 0);
        int32_t total, inputs, sources, tachs;
        ASSERT_EQ(ost7720_getNumChans(s, &total, &inputs, &sources, &tachs), 0);
        EXPECT_EQ(inputs, 16);
        EXPECT_EQ(sources, 2);
        EXPECT_EQ(total, 18);
    }
    sim::reset();
}

TEST(SimDiscovery, MalformedEnvironmentMakesFindFailWithTheReason) {
    struct Case {
        const char* value;
        const char* reason;
    };
    const Case cases[] = {
        {"8:8:1:2", "expected address:inputs:sources:tachs:megabytes"},
        {"8:8:1:2:8:1", "expected address"},
        {"8:8:1:2:8,", "module 2"},
        {",8:8:1:2:8", "module 1"},
        {"x:8:1:2:8", "address \"x\" is not a whole number"},
        {"8:8:1:2:-8", "megabytes \"-8\""},
        {" 8:8:1:2:8", "address \" 8\""},
        {"8:8:1:2:8 ", "megabytes \"8 \""},
        {"99999999999999999999:8:1:2:8", "not a whole number"},
        {"0:8:1:2:8", "address 0 not in 1..255"},
        {"256:8:1:2:8", "address 256"},
        {"8:65:1:2:8", "inputs 65"},
        {"8:8:9:2:8", "sources 9"},
        {"8:8:1:9:8", "tachs"},
        {"8:8:1:2:0", "megabytes 0"},
        {"8:8:1:2:8,8:4:0:0:8", "address 8 used twice"},
        {"8:8:1:2:8;16:8:1:0:32", "expected"},
    };
    for (const Case& c : cases) {
        EnvVar env("OST7720_SIM_MODULES", c.value);
        sim::reset_from_environment();
        Found f = find();
        EXPECT_EQ(f.status, sim::err_configuration) << c.value;
        std::string d = details(0);
        EXPECT_NE(d.find("ost7720_find: OST7720_SIM_MODULES"), std::string::npos) << d;
        EXPECT_NE(d.find(c.reason), std::string::npos) << c.value << " -> " << d;
        int32_t s = 99;
        EXPECT_LT(ost7720_initA("VXI0::8::INSTR", 1, 1, &s), 0);
        EXPECT_EQ(s, 0);
    }
    std::string fifty_one;
    for (int i = 1; i <= 51; ++i)
        fifty_one += (i > 1 ? "," : "") + std::to_string(i) + ":1:0:0:1";
    EnvVar env("OST7720_SIM_MODULES", fifty_one.c_str());
    sim::reset_from_environment();
    EXPECT_EQ(find().status, sim::err_configuration);
    EXPECT_NE(details(0).find("more than 50 modules"), std::string::npos);
    sim::reset();
}

TEST(SimDiscovery, ResourceListOrderFixesChannelNumbering) {
    sim::reset();
    int32_t both = simtest::open_both();
    ASSERT_NE(both, 0);
    int32_t total, inputs, sources, tachs;
    ASSERT_EQ(ost7720_getNumChans(both, &total, &inputs, &sources, &tachs), 0);
    EXPECT_EQ(total, 20);
    EXPECT_EQ(inputs, 16);
    EXPECT_EQ(sources, 2);
    EXPECT_EQ(tachs, 2);

    // Input 1 of the list session is input 1 of module 16; input 9 is input 1 of module 8.
    ASSERT_EQ(ost7720_setRange(both, 1, 5.0), 0);
    ASSERT_EQ(ost7720_setRange(both, 9, 0.5), 0);
    int32_t m16 = 0, m8 = 0;
    ASSERT_EQ(ost7720_initC("VXI0::16::INSTR", 1, 0, &m16), 0);
    ASSERT_EQ(ost7720_initC("VXI0::8::INSTR", 1, 0, &m8), 0);
    double r = 0;
    ASSERT_EQ(ost7720_getRange(m16, 1, &r), 0);
    EXPECT_EQ(r, 5.0);
    ASSERT_EQ(ost7720_getRange(m8, 1, &r), 0);
    EXPECT_EQ(r, 0.5);
    // Sources 4097 (module 16) and 4098 (module 8); tachometers only on module 8.
    ASSERT_EQ(ost7720_setSineFreq(both, 4098, 250.0), 0);
    double f = 0;
    ASSERT_EQ(ost7720_getSineFreq(m8, 4097, &f), 0);
    EXPECT_EQ(f, 250.0);
    ASSERT_EQ(ost7720_setTriggerChannel(both, 8194, 420), 0);
    int32_t trig = 0;
    ASSERT_EQ(ost7720_getTriggerChannel(m8, 8194, &trig), 0);
    EXPECT_EQ(trig, 420);
    EXPECT_EQ(ost7720_getTriggerChannel(m8, 8195, &trig), sim::err_invalid_channel);
    EXPECT_EQ(ost7720_getTriggerChannel(m16, 8193, &trig), sim::err_invalid_channel);
}

TEST(SimDiscovery, ResourceStringsAreParsedStrictly) {
    sim::reset();
    struct Case {
        const char* resource;
        int32_t status;
        const char* reason;
    };
    const Case single[] = {
        {"", sim::err_resource_syntax, "empty resource string"},
        {"VXI1::8::INSTR", sim::err_resource_not_found, "unknown interface \"VXI1\""},
        {"vxi0::8::INSTR", sim::err_resource_not_found, "unknown interface"},
        {"VXI0::9::INSTR", sim::err_resource_not_found, "no module at address 9"},
        {"VXI0::8::INST", sim::err_resource_syntax, "does not end in ::INSTR"},
        {"VXI0::8::INSTR ", sim::err_resource_syntax, "does not end in ::INSTR"},
        {"VXI0:8::INSTR", sim::err_resource_syntax, "is not interface::address::INSTR"},
        {"VXI0::08::INSTR", sim::err_resource_syntax, "address \"08\""},
        {"VXI0:: 8::INSTR", sim::err_resource_syntax, "address \" 8\""},
        {"VXI0::::INSTR", sim::err_resource_syntax, "address \"\""},
        {"VXI0::256::INSTR", sim::err_resource_syntax, "not a number 1..255"},
        {"VXI0::-8::INSTR", sim::err_resource_syntax, "address \"-8\""},
        {"VXI0::16,8::INSTR", sim::err_resource_syntax, "a resource list needs ost7720_init"},
        {"VXI0::8::9::INSTR", sim::err_resource_syntax, "address \"8::9\""},
    };
    for (const Case& c : single) {
        int32_t s = 77;
        EXPECT_EQ(ost7720_initA(c.resource, 1, 1, &s), c.status) << c.resource;
        EXPECT_EQ(s, 0) << c.resource;
        std::string d = details(0);
        EXPECT_EQ(d.rfind("ost7720_initA: ", 0), 0u) << d;
        EXPECT_NE(d.find(c.reason), std::string::npos) << c.resource << " -> " << d;
    }
    const Case lists[] = {
        {"VXI0::16,8,16::INSTR", sim::err_resource_syntax, "address 16 repeated"},
        {"VXI0::16,,8::INSTR", sim::err_resource_syntax, "address \"\""},
        {"VXI0::16,8,::INSTR", sim::err_resource_syntax, "address \"\""},
        {"VXI0::16,24::INSTR", sim::err_resource_not_found, "no module at address 24"},
        {"", sim::err_resource_syntax, "empty"},
    };
    for (const Case& c : lists) {
        int32_t s = 77;
        EXPECT_EQ(ost7720_init(c.resource, 1, 1, &s), c.status) << c.resource;
        EXPECT_EQ(s, 0);
        EXPECT_NE(details(0).find(c.reason), std::string::npos) << c.resource << " -> " << details(0);
    }
    int32_t s = 77;
    EXPECT_EQ(ost7720_init(nullptr, 1, 1, &s), sim::err_null_pointer);
    EXPECT_EQ(s, 0);
    EXPECT_EQ(ost7720_init("VXI0::8::INSTR", 1, 1, nullptr), sim::err_null_pointer);
    std::string huge(5000, '8');
    EXPECT_EQ(ost7720_init(huge.c_str(), 1, 1, &s), sim::err_resource_syntax);

    ASSERT_EQ(ost7720_initA("VXI0::8::INSTR", 1, 1, &s), 0);
    EXPECT_NE(s, 0);
    ASSERT_EQ(ost7720_init("VXI0::8::INSTR", 1, 1, &s), 0);
    EXPECT_NE(s, 0);
}

TEST(SimDiscovery, HardwareConfigurationAnswersWithoutASession) {
    sim::reset({{8, 8, 1, 2, 8}, {16, 8, 1, 0, 32}, {30, 64, 0, 0, 1}});
    std::vector<int32_t> records(27 * 3 + 5, -3);
    const int32_t addresses[3] = {16, 8, 30};
    ASSERT_EQ(ost7720_getHWConfig(0, 3, addresses, records.data()), 0);
    EXPECT_EQ(records[25], 32 * 262144);
    EXPECT_EQ(records[27 + 25], 2097152);
    EXPECT_EQ(records[54 + 25], 262144);
    EXPECT_EQ(records[0], 16);
    EXPECT_EQ(records[27 + 6], 8);      // inputs
    EXPECT_EQ(records[27 + 8], 2);      // tachometers
    EXPECT_EQ(records[54 + 20], 2048);  // largest block 1 MB holds for 64 channels
    EXPECT_EQ(records[81], -3);

    std::vector<int32_t> one(27 + 1, -3);
    const int32_t unknown[1] = {9};
    EXPECT_EQ(ost7720_getHWConfig(0, 1, unknown, one.data()), sim::err_resource_not_found);
    EXPECT_NE(details(0).find("no module at address 9"), std::string::npos);
    EXPECT_EQ(one[0], -3);
    EXPECT_EQ(ost7720_getHWConfig(0, -1, addresses, one.data()), sim::err_invalid_count);
    EXPECT_EQ(ost7720_getHWConfig(0, 1, addresses, nullptr), sim::err_null_pointer);

    int32_t s = simtest::open_both();
    EXPECT_EQ(ost7720_getHWConfig(s, 1, addresses, one.data()), 0);
    EXPECT_EQ(one[25], 32 * 262144);
    EXPECT_EQ(one[27], -3);
    ASSERT_EQ(ost7720_close(s), 0);
    EXPECT_EQ(ost7720_getHWConfig(s, 1, addresses, one.data()), sim::err_invalid_session);
}
