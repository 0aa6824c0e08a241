// Sessions, handles and channel groups.
#include <gtest/gtest.h>

#include <cstring>
#include <set>
#include <string>

#include "errors.h"
#include "sim_test_util.h"

using simtest::details;

TEST(SimSessions, HandlesAreNonZeroUniqueAndRefusedOnceClosed) {
    sim::reset();
    int32_t a = simtest::open_both();
    int32_t b = simtest::open_both();
    EXPECT_NE(a, 0);
    EXPECT_NE(b, 0);
    EXPECT_NE(a, b);
    ASSERT_EQ(ost7720_close(a), 0);

    int32_t total, inputs, sources, tachs;
    EXPECT_EQ(ost7720_getNumChans(a, &total, &inputs, &sources, &tachs), sim::err_invalid_session);
    EXPECT_EQ(details(a), "ost7720_getNumChans: session " + std::to_string(a) + " is not open");
    EXPECT_EQ(ost7720_close(a), sim::err_invalid_session);
    EXPECT_EQ(ost7720_setBlocksize(12345, 1, 1024), sim::err_invalid_session);
    EXPECT_EQ(ost7720_getNumChans(b, &total, &inputs, &sources, &tachs), 0);

    // A new session never gets the closed handle back.
    int32_t c = simtest::open_both();
    EXPECT_NE(c, a);
    EXPECT_NE(c, b);
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
    EXPECT_EQ(ost7720_setBlocksize(0, 1, 1024), sim::err_no_session);
    EXPECT_NE(details(0).find("ost7720_setBlocksize"), std::string::npos);

    // Revision and error texts answer without a session.
    char drv[300], fw[300];
    std::memset(drv, '#', sizeof drv);
    std::memset(fw, '#', sizeof fw);
    EXPECT_EQ(ost7720_revision_query(0, drv, fw), 0);
    EXPECT_GT(std::strlen(drv), 0u);
    EXPECT_LT(std::strlen(drv), 255u);
    for (size_t i = 255; i < sizeof drv; ++i)
        ASSERT_EQ(drv[i], '#');
    char msg[256];
    EXPECT_EQ(ost7720_error_message(0, sim::err_no_session, msg), 0);
    EXPECT_STREQ(msg, "The call needs an open session");
}

TEST(SimSessions, StagedInitContinuesOneSession) {
    sim::reset();
    int32_t a = 0, b = 0, c = 0;
    ASSERT_EQ(ost7720_initA("VXI0::8::INSTR", 1, 1, &a), 0);
    ASSERT_EQ(ost7720_initB3("VXI0::8::INSTR", 1, 1, &b), 0);
    ASSERT_EQ(ost7720_initC("VXI0::8::INSTR", 1, 1, &c), 0);
    EXPECT_EQ(a, b);
    EXPECT_EQ(b, c);
    int32_t total, inputs, sources, tachs;
    ASSERT_EQ(ost7720_getNumChans(c, &total, &inputs, &sources, &tachs), 0);
    EXPECT_EQ(inputs, 8);
    EXPECT_EQ(sources, 1);
    EXPECT_EQ(tachs, 2);
    EXPECT_EQ(total, 11);
    ASSERT_EQ(ost7720_close(c), 0);
    EXPECT_EQ(ost7720_close(a), sim::err_invalid_session);

    // Each stage alone opens a session of its own.
    int32_t d = 0, e = 0;
    ASSERT_EQ(ost7720_initC("VXI0::16::INSTR", 1, 1, &d), 0);
    ASSERT_EQ(ost7720_initC("VXI0::16::INSTR", 1, 1, &e), 0);
    EXPECT_NE(d, e);
}

TEST(SimGroups, IdsAreUniqueAndNeverChannelIds) {
    sim::reset({{8, 64, 8, 8, 64}});
    int32_t s = 0;
    ASSERT_EQ(ost7720_init("VXI0::8::INSTR", 1, 1, &s), 0);
    int32_t s2 = 0;
    ASSERT_EQ(ost7720_init("VXI0::8::INSTR", 1, 1, &s2), 0);
    std::set<int32_t> ids;
    const int32_t members[2] = {1, 2};
    for (int round = 0; round < 3; ++round) {
        for (int i = 0; i < 5; ++i) {
            int32_t g = 0;
            ASSERT_EQ(ost7720_createChannelGroup(s, i % 3, members, &g), 0);
            EXPECT_GE(g, 0x10000);
            EXPECT_TRUE(ids.insert(g).second) << g;
            ASSERT_EQ(ost7720_createChannelGroup(s2, 0, nullptr, &g), 0);
            EXPECT_TRUE(ids.insert(g).second) << g;
        }
        ASSERT_EQ(ost7720_deleteAllChanGroups(s), 0);
    }
}

TEST(SimGroups, AGroupAppliesToEveryMemberAndReadsItsFirst) {
    sim::reset();
    int32_t s = simtest::open_both();
    const int32_t members[3] = {3, 1, 3};
    int32_t g = 0, empty = 0;
    ASSERT_EQ(ost7720_createChannelGroup(s, 3, members, &g), 0);
    ASSERT_EQ(ost7720_createChannelGroup(s, 0, nullptr, &empty), 0);
    EXPECT_NE(empty, 0);

    ASSERT_EQ(ost7720_setCoupling(s, 3, 101), 0);
    ASSERT_EQ(ost7720_setCoupling(s, 1, 100), 0);
    int32_t coupling = 0;
    ASSERT_EQ(ost7720_getCoupling(s, g, &coupling), 0);
    EXPECT_EQ(coupling, 101);  // member 3 comes first

    ASSERT_EQ(ost7720_setRange(s, g, 0.5), 0);
    double r = 0;
    for (int32_t ch : {1, 3}) {
        ASSERT_EQ(ost7720_getRange(s, ch, &r), 0);
        EXPECT_EQ(r, 0.5) << ch;
    }
    ASSERT_EQ(ost7720_getRange(s, 2, &r), 0);
    EXPECT_EQ(r, 2.0);

    // An empty group takes settings (nothing to do) but has nothing to read.
    EXPECT_EQ(ost7720_setActive(s, empty, 421), 0);
    int32_t active = 0;
    EXPECT_EQ(ost7720_getActive(s, empty, &active), sim::err_invalid_channel);
    EXPECT_EQ(details(s), "ost7720_getActive: group " + std::to_string(empty) + " is empty");

    // Groups belong to their session and go with deleteAllChanGroups.
    int32_t other = simtest::open_both();
    EXPECT_EQ(ost7720_setRange(other, g, 1.0), sim::err_invalid_channel);
    ASSERT_EQ(ost7720_deleteAllChanGroups(s), 0);
    EXPECT_EQ(ost7720_setRange(s, g, 1.0), sim::err_invalid_channel);
    EXPECT_EQ(details(s),
              "ost7720_setRange: channel " + std::to_string(g) + " is not in session " + std::to_string(s));
}

TEST(SimGroups, BadMembersAndMixedKindsAreRefusedWholly) {
    sim::reset();
    int32_t s = simtest::open_both();
    int32_t g = -5;
    const int32_t bad[3] = {1, 17, 2};
    EXPECT_EQ(ost7720_createChannelGroup(s, 3, bad, &g), sim::err_invalid_channel);
    EXPECT_EQ(g, -5);
    EXPECT_EQ(details(s), "ost7720_createChannelGroup: channel 17 is not in session " + std::to_string(s));
    const int32_t past_sources[1] = {4099};
    EXPECT_EQ(ost7720_createChannelGroup(s, 1, past_sources, &g), sim::err_invalid_channel);
    EXPECT_EQ(ost7720_createChannelGroup(s, -1, bad, &g), sim::err_invalid_count);
    EXPECT_EQ(ost7720_createChannelGroup(s, 2, nullptr, &g), sim::err_null_pointer);
    EXPECT_EQ(ost7720_createChannelGroup(s, 0, nullptr, nullptr), sim::err_null_pointer);

    // A group of an input and a source cannot take an input-only setting: nothing changes.
    const int32_t mixed[2] = {1, 4097};
    ASSERT_EQ(ost7720_createChannelGroup(s, 2, mixed, &g), 0);
    EXPECT_EQ(ost7720_setCoupling(s, g, 100), sim::err_wrong_channel_type);
    EXPECT_EQ(details(s), "ost7720_setCoupling: channel 4097 is a source; the call takes inputs");
    int32_t coupling = 0;
    ASSERT_EQ(ost7720_getCoupling(s, 1, &coupling), 0);
    EXPECT_EQ(coupling, 101);
    // ...but one both kinds have.
    EXPECT_EQ(ost7720_setActive(s, g, 421), 0);
    int32_t active = 0;
    ASSERT_EQ(ost7720_getActive(s, 4097, &active), 0);
    EXPECT_EQ(active, 421);
}
