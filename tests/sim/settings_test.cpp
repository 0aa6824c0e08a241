// Per-channel settings: power-on values, coercion and refusal, preset.
#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <string>

#include "errors.h"
#include "sim_test_util.h"

using simtest::details;

namespace {

int32_t blocksize_after(int32_t s, int32_t ch, int32_t request, int32_t* status) {
    *status = ost7720_setBlocksize(s, ch, request);
    int32_t v = 0;
    ost7720_getBlocksize(s, ch, &v);
    return v;
}

double span_after(int32_t s, double request, int32_t* status) {
    *status = ost7720_setSpan(s, 1, request);
    double v = 0;
    ost7720_getSpan(s, 1, &v);
    return v;
}

double range_after(int32_t s, int32_t ch, double request, int32_t* status) {
    *status = ost7720_setRange(s, ch, request);
    double v = 0;
    ost7720_getRange(s, ch, &v);
    return v;
}

}  // namespace

TEST(SimSettings, BlockSizeIsCoercedUpToAPowerOfTwoTheMemoryHolds) {
    sim::reset({{8, 8, 1, 2, 8}, {30, 64, 0, 0, 1}});
    int32_t s = 0;
    ASSERT_EQ(ost7720_init("VXI0::8,30::INSTR", 1, 1, &s), 0);
    int32_t st = 0;
    EXPECT_EQ(blocksize_after(s, 1, 1000, &st), 1024);
    EXPECT_EQ(st, 0);
    EXPECT_EQ(blocksize_after(s, 1, 1, &st), 64);
    EXPECT_EQ(blocksize_after(s, 1, 1025, &st), 2048);
    EXPECT_EQ(blocksize_after(s, 1, 65536, &st), 65536);
    EXPECT_EQ(blocksize_after(s, 1, 65537, &st), 65536);
    EXPECT_EQ(st, sim::err_invalid_value);
    EXPECT_EQ(details(s), "ost7720_setBlocksize: block size 65537 not in 1..65536 (module 8)");
    EXPECT_EQ(blocksize_after(s, 1, 0, &st), 65536);
    EXPECT_EQ(st, sim::err_invalid_value);
    EXPECT_EQ(blocksize_after(s, 1, -1024, &st), 65536);
    EXPECT_EQ(st, sim::err_invalid_value);

    // 1 MB shared by 64 inputs holds blocks of 2048 at most (two 4-byte buffers per channel).
    EXPECT_EQ(blocksize_after(s, 9, 2000, &st), 2048);
    EXPECT_EQ(blocksize_after(s, 9, 2049, &st), 2048);
    EXPECT_EQ(st, sim::err_invalid_value);
    EXPECT_NE(details(s).find("(module 30)"), std::string::npos);
    // Source channels have no measurement block size.
    EXPECT_EQ(ost7720_setBlocksize(s, 4097, 1024), sim::err_wrong_channel_type);
}

TEST(SimSettings, SpanIsCoercedUpToTwentyKilohertzOverAPowerOfTwo) {
    sim::reset();
    int32_t s = simtest::open_both();
    int32_t st = 0;
    EXPECT_EQ(span_after(s, 15000, &st), 20000);
    EXPECT_EQ(st, 0);
    EXPECT_EQ(span_after(s, 10000, &st), 10000);
    EXPECT_EQ(span_after(s, 9999.5, &st), 10000);
    EXPECT_EQ(span_after(s, 5000.01, &st), 10000);
    EXPECT_EQ(span_after(s, 625, &st), 625);
    EXPECT_EQ(span_after(s, 600, &st), 625);
    EXPECT_EQ(span_after(s, 1e-9, &st), 20000.0 / 524288);
    EXPECT_EQ(span_after(s, 2500, &st), 2500);

    EXPECT_EQ(span_after(s, 30000, &st), 2500);
    EXPECT_EQ(st, sim::err_invalid_value);
    EXPECT_EQ(details(s), "ost7720_setSpan: span 30000 Hz above the maximum 20000 Hz");
    EXPECT_EQ(span_after(s, 20000.001, &st), 2500);
    EXPECT_EQ(st, sim::err_invalid_value);
    EXPECT_EQ(span_after(s, 0, &st), 2500);
    EXPECT_EQ(st, sim::err_invalid_value);
    EXPECT_EQ(details(s), "ost7720_setSpan: span 0 Hz not above 0");
    EXPECT_EQ(span_after(s, -100, &st), 2500);
    EXPECT_EQ(span_after(s, std::numeric_limits<double>::quiet_NaN(), &st), 2500);
    EXPECT_EQ(st, sim::err_invalid_value);
    EXPECT_EQ(span_after(s, std::numeric_limits<double>::infinity(), &st), 2500);
    EXPECT_EQ(st, sim::err_invalid_value);
}

TEST(SimSettings, InputRangeSnapsUpToOneTwoFiveStepsAndSourceRangeIsContinuous) {
    sim::reset();
    int32_t s = simtest::open_both();
    int32_t st = 0;
    EXPECT_EQ(range_after(s, 1, 3, &st), 5);
    EXPECT_EQ(st, 0);
    EXPECT_EQ(range_after(s, 1, 0.15, &st), 0.2);
    EXPECT_EQ(range_after(s, 1, 0, &st), 0.1);
    EXPECT_EQ(range_after(s, 1, 1, &st), 1);
    EXPECT_EQ(range_after(s, 1, 5.5, &st), 10);
    EXPECT_EQ(range_after(s, 1, 20, &st), 10);
    EXPECT_EQ(st, sim::err_invalid_value);
    EXPECT_EQ(details(s), "ost7720_setRange: range 20 V above 10 V");
    EXPECT_EQ(range_after(s, 1, -1, &st), 10);
    EXPECT_EQ(st, sim::err_invalid_value);

    EXPECT_EQ(range_after(s, 4097, 3, &st), 3);
    EXPECT_EQ(range_after(s, 4097, 0.25, &st), 0.25);
    EXPECT_EQ(range_after(s, 4097, 10.5, &st), 0.25);
    EXPECT_EQ(st, sim::err_invalid_value);
    EXPECT_EQ(ost7720_setRange(s, 8193, 1.0), sim::err_wrong_channel_type);
}

TEST(SimSettings, UnknownCodesAndOutOfRangeValuesAreRefusedAndKeepTheOldValue) {
    sim::reset();
    int32_t s = simtest::open_both();
    EXPECT_EQ(ost7720_setCoupling(s, 1, 102), sim::err_invalid_code);
    EXPECT_EQ(details(s), "ost7720_setCoupling: coupling code 102 unknown");
    EXPECT_EQ(ost7720_setInputMode(s, 1, 135), sim::err_invalid_code);
    EXPECT_EQ(ost7720_setAntiAliasDigital(s, 1, 617), sim::err_invalid_code);
    EXPECT_EQ(ost7720_setTriggerSlope(s, 1, 412), sim::err_invalid_code);
    EXPECT_EQ(ost7720_setTriggerMode(s, 1, 416), sim::err_invalid_code);
    EXPECT_EQ(ost7720_setTriggerLevel(s, 1, 418, 0.0), sim::err_invalid_code);
    EXPECT_EQ(ost7720_setTriggerLevel(s, 1, 417, 100.5), sim::err_invalid_value);
    EXPECT_EQ(details(s), "ost7720_setTriggerLevel: trigger level 100.5 % not in -100..100");
    EXPECT_EQ(ost7720_setDataMode(s, 1, 342), sim::err_invalid_code);
    EXPECT_EQ(ost7720_setCalcData(s, 1, 726), sim::err_invalid_code);
    EXPECT_EQ(ost7720_setEnable(s, 1, 272, 280), sim::err_invalid_code);
    EXPECT_EQ(ost7720_setEnable(s, 1, 270, 282), sim::err_invalid_code);
    EXPECT_EQ(ost7720_setAvgMode(s, 1, 704), sim::err_invalid_code);
    EXPECT_EQ(ost7720_setAvgNumber(s, 1, 0), sim::err_invalid_value);
    EXPECT_EQ(ost7720_setWindow(s, 1, 713), sim::err_invalid_code);
    EXPECT_EQ(ost7720_setArmMode(s, 1, 432), sim::err_invalid_code);
    EXPECT_EQ(ost7720_setAutoTrigger(s, 1, 442), sim::err_invalid_code);
    EXPECT_EQ(ost7720_setActive(s, 1, 422), sim::err_invalid_code);
    EXPECT_EQ(ost7720_setTriggerChannel(s, 4097, 0), sim::err_invalid_code);
    EXPECT_EQ(ost7720_setSourceMode(s, 4097, 178), sim::err_invalid_code);
    EXPECT_EQ(ost7720_setSourceOutput(s, 4097, 705), sim::err_invalid_code);
    EXPECT_EQ(ost7720_setSourceSum(s, 4097, 192), sim::err_invalid_code);
    EXPECT_EQ(ost7720_setSourceCola(s, 4097, 182), sim::err_invalid_code);
    EXPECT_EQ(ost7720_setRampRate(s, 4097, 100.5), sim::err_invalid_value);
    EXPECT_EQ(ost7720_setRampRate(s, 4097, -1), sim::err_invalid_value);
    EXPECT_EQ(ost7720_setSineFreq(s, 4097, 25601), sim::err_invalid_value);
    EXPECT_EQ(details(s), "ost7720_setSineFreq: sine frequency 25601 not in 0..25600");
    EXPECT_EQ(ost7720_setSinePhase(s, 4097, -361), sim::err_invalid_value);
    EXPECT_EQ(ost7720_setSourceSeed(s, 4097, 256), sim::err_invalid_value);
    EXPECT_EQ(ost7720_setDutyCycle(s, 4097, 1.5), sim::err_invalid_value);
    EXPECT_EQ(ost7720_setDutyCycle(s, 4097, std::nan("")), sim::err_invalid_value);
    // Type checks name the channel.
    EXPECT_EQ(ost7720_setSineFreq(s, 1, 100), sim::err_wrong_channel_type);
    EXPECT_EQ(details(s), "ost7720_setSineFreq: channel 1 is an input; the call takes sources");
    EXPECT_EQ(ost7720_setCoupling(s, 8193, 100), sim::err_wrong_channel_type);
    EXPECT_EQ(ost7720_setCoupling(s, 17, 100), sim::err_invalid_channel);
    EXPECT_EQ(details(s), "ost7720_setCoupling: channel 17 is not in session " + std::to_string(s));

    // Everything above kept its power-on value.
    int32_t v = 0;
    double d = 0;
    ost7720_getCoupling(s, 1, &v);
    EXPECT_EQ(v, 101);
    ost7720_getInputMode(s, 1, &v);
    EXPECT_EQ(v, 130);
    ost7720_getTriggerLevel(s, 1, 417, &d);
    EXPECT_EQ(d, 10.0);
    ost7720_getSourceMode(s, 4097, &v);
    EXPECT_EQ(v, 170);
    ost7720_getSineFreq(s, 4097, &d);
    EXPECT_EQ(d, 1000.0);
    ost7720_getDutyCycle(s, 4097, &d);
    EXPECT_EQ(d, 1.0);
    ost7720_getEnable(s, 1, 270, &v);
    EXPECT_EQ(v, 280);
}

TEST(SimSettings, PowerOnValuesAndTheFirstSourceOfTheLowestModule) {
    sim::reset();
    int32_t s = simtest::open_both();  // module 16 first: source 4097 is module 16's
    int32_t v = 0;
    double d = 0;
    ASSERT_EQ(ost7720_getActive(s, 4098, &v), 0);
    EXPECT_EQ(v, 420);
    ASSERT_EQ(ost7720_getActive(s, 4097, &v), 0);
    EXPECT_EQ(v, 421);
    ost7720_getSourceMode(s, 4098, &v);
    EXPECT_EQ(v, 170);
    ost7720_getSourceOutput(s, 4098, &v);
    EXPECT_EQ(v, 700);
    ost7720_getRange(s, 4098, &d);
    EXPECT_EQ(d, 1.0);
    ost7720_getSineFreq(s, 4098, &d);
    EXPECT_EQ(d, 1000.0);
    ost7720_getRampRate(s, 4098, &d);
    EXPECT_EQ(d, 0.0);

    for (int32_t ch : {1, 16}) {
        ost7720_getActive(s, ch, &v);
        EXPECT_EQ(v, 420);
        ost7720_getTriggerChannel(s, ch, &v);
        EXPECT_EQ(v, 421);
        ost7720_getBlocksize(s, ch, &v);
        EXPECT_EQ(v, 1024);
        ost7720_getSpan(s, ch, &d);
        EXPECT_EQ(d, 20000.0);
        ost7720_getTriggerSlope(s, ch, &v);
        EXPECT_EQ(v, 410);
        ost7720_getTriggerLevel(s, ch, 416, &d);
        EXPECT_EQ(d, 5.0);
    }

    // With no source on the lowest module, the next module's source is the one that is on.
    sim::reset({{4, 8, 0, 0, 8}, {9, 8, 2, 0, 8}});
    ASSERT_EQ(ost7720_init("VXI0::9,4::INSTR", 1, 1, &s), 0);
    ost7720_getActive(s, 4097, &v);
    EXPECT_EQ(v, 420);
    ost7720_getActive(s, 4098, &v);
    EXPECT_EQ(v, 421);
}

TEST(SimSettings, PresetAndResetRestorePowerOnValues) {
    sim::reset();
    int32_t s = simtest::open_both();
    ASSERT_EQ(ost7720_setCoupling(s, 2, 100), 0);
    ASSERT_EQ(ost7720_setRange(s, 2, 10), 0);
    ASSERT_EQ(ost7720_setTriggerLevel(s, 2, 416, -50), 0);
    ASSERT_EQ(ost7720_setBlocksize(s, 2, 4096), 0);
    ASSERT_EQ(ost7720_setCoupling(s, 3, 100), 0);
    ASSERT_EQ(ost7720_setActive(s, 4098, 421), 0);
    ASSERT_EQ(ost7720_setSourceMode(s, 4098, 176), 0);

    ASSERT_EQ(ost7720_preset(s, 2), 0);
    int32_t v = 0;
    double d = 0;
    ost7720_getCoupling(s, 2, &v);
    EXPECT_EQ(v, 101);
    ost7720_getRange(s, 2, &d);
    EXPECT_EQ(d, 2.0);
    ost7720_getTriggerLevel(s, 2, 416, &d);
    EXPECT_EQ(d, 5.0);
    ost7720_getBlocksize(s, 2, &v);
    EXPECT_EQ(v, 1024);
    ost7720_getCoupling(s, 3, &v);
    EXPECT_EQ(v, 100);  // untouched

    ASSERT_EQ(ost7720_preset(s, 4098), 0);
    ost7720_getActive(s, 4098, &v);
    EXPECT_EQ(v, 420);  // the first source powers on active
    ost7720_getSourceMode(s, 4098, &v);
    EXPECT_EQ(v, 170);
    EXPECT_EQ(ost7720_preset(s, 99), sim::err_invalid_channel);

    // Opening without reset keeps the settings; with reset restores them.
    int32_t keep = 0, fresh = 0;
    ASSERT_EQ(ost7720_init("VXI0::16,8::INSTR", 1, 0, &keep), 0);
    ost7720_getCoupling(keep, 3, &v);
    EXPECT_EQ(v, 100);
    ASSERT_EQ(ost7720_init("VXI0::16::INSTR", 1, 1, &fresh), 0);
    ost7720_getCoupling(keep, 3, &v);
    EXPECT_EQ(v, 101);
}

TEST(SimSettings, EverySettingReadsBackWhatWasStored) {
    sim::reset();
    int32_t s = simtest::open_both();
    struct IntPair {
        int32_t (*set)(int32_t, int32_t, int32_t);
        int32_t (*get)(int32_t, int32_t, int32_t*);
        int32_t channel;
        int32_t value;
    };
    const IntPair ints[] = {
        {ost7720_setActive, ost7720_getActive, 5, 421},
        {ost7720_setTriggerChannel, ost7720_getTriggerChannel, 5, 420},
        {ost7720_setTriggerChannel, ost7720_getTriggerChannel, 8194, 420},
        {ost7720_setCoupling, ost7720_getCoupling, 5, 100},
        {ost7720_setAntiAliasDigital, ost7720_getAntiAliasDigital, 5, 616},
        {ost7720_setInputMode, ost7720_getInputMode, 5, 133},
        {ost7720_setTriggerSlope, ost7720_getTriggerSlope, 5, 411},
        {ost7720_setTriggerMode, ost7720_getTriggerMode, 5, 415},
        {ost7720_setSourceMode, ost7720_getSourceMode, 4097, 177},
        {ost7720_setSourceOutput, ost7720_getSourceOutput, 4097, 704},
        {ost7720_setSourceSum, ost7720_getSourceSum, 4097, 191},
        {ost7720_setSourceCola, ost7720_getSourceCola, 4097, 181},
        {ost7720_setSourceSeed, ost7720_getSourceSeed, 4097, 255},
    };
    for (const IntPair& p : ints) {
        ASSERT_EQ(p.set(s, p.channel, p.value), 0) << p.value;
        int32_t v = -1;
        ASSERT_EQ(p.get(s, p.channel, &v), 0);
        EXPECT_EQ(v, p.value);
    }
    struct DoublePair {
        int32_t (*set)(int32_t, int32_t, double);
        int32_t (*get)(int32_t, int32_t, double*);
        double value;
    };
    const DoublePair doubles[] = {
        {ost7720_setRampRate, ost7720_getRampRate, 2.5},
        {ost7720_setSineFreq, ost7720_getSineFreq, 25600},
        {ost7720_setSinePhase, ost7720_getSinePhase, -360},
        {ost7720_setDutyCycle, ost7720_getDutyCycle, 0.25},
        {ost7720_setRange, ost7720_getRange, 0.0},
    };
    for (const DoublePair& p : doubles) {
        ASSERT_EQ(p.set(s, 4097, p.value), 0) << p.value;
        double v = -1;
        ASSERT_EQ(p.get(s, 4097, &v), 0);
        EXPECT_EQ(v, p.value);
    }
    ASSERT_EQ(ost7720_setEnable(s, 5, 271, 280), 0);
    ASSERT_EQ(ost7720_setEnable(s, 5, 270, 281), 0);
    int32_t v = 0;
    ost7720_getEnable(s, 5, 271, &v);
    EXPECT_EQ(v, 280);
    ost7720_getEnable(s, 5, 270, &v);
    EXPECT_EQ(v, 281);
    ASSERT_EQ(ost7720_setTriggerLevel(s, 5, 416, 40), 0);
    ASSERT_EQ(ost7720_setTriggerLevel(s, 5, 417, 50), 0);
    double lower = 0, upper = 0;
    ost7720_getTriggerLevel(s, 5, 416, &lower);
    ost7720_getTriggerLevel(s, 5, 417, &upper);
    EXPECT_EQ(lower, 40);
    EXPECT_EQ(upper, 50);
    EXPECT_EQ(ost7720_getCoupling(s, 5, nullptr), sim::err_null_pointer);
}
