// Per-channel settings: coercion and refusal with their details, power-on values, preset.
#include <functional>
#include <limits>

#include "sim_test_util.h"

using simtest::details;
using simtest::get;

namespace {

constexpr int32_t ok = 0, bad_value = sim::err_invalid_value, bad_code = sim::err_invalid_code;
constexpr double not_a_number = std::numeric_limits<double>::quiet_NaN();
constexpr double inf = std::numeric_limits<double>::infinity();

// A setting's set and get calls, whole-number settings carried as doubles so one table holds all.
struct Setting {
    std::function<int32_t(int32_t, int32_t, double)> set;
    std::function<double(int32_t, int32_t)> get;
};

template <class T>
Setting setting(int32_t (*set)(int32_t, int32_t, T), int32_t (*getter)(int32_t, int32_t, T*)) {
    return {[set](int32_t s, int32_t ch, double v) { return set(s, ch, static_cast<T>(v)); },
            [getter](int32_t s, int32_t ch) { return static_cast<double>(get(getter, s, ch)); }};
}

#define SETTING(name) setting(ost7720_set##name, ost7720_get##name)

}  // namespace

TEST(SimSettings, BlockSizeSpanAndRangeAreCoercedOrRefusedKeepingTheOldValue) {
    sim::reset({{8, 8, 1, 2, 8}, {30, 64, 0, 0, 1}});
    int32_t s = 0;
    ASSERT_EQ(ost7720_init("VXI0::8,30::INSTR", 1, 1, &s), 0);
    struct Step {
        double request, kept;
        int32_t status;
        const char* detail = nullptr;
    };
    // clang-format off
    const struct { Setting setting; int32_t channel; std::vector<Step> steps; } runs[] = {
        // In order: a refused request keeps the value before it.
        {SETTING(Blocksize), 1, {{1000, 1024, ok}, {1, 64, ok}, {1025, 2048, ok}, {65536, 65536, ok},
            {0, 65536, bad_value}, {-1024, 65536, bad_value},
            {65537, 65536, bad_value, "ost7720_setBlocksize: block size 65537 not in 1..65536 (module 8)"}}},
        // 1 MB for 64 inputs holds two 4-byte buffers of 2048 samples each.
        {SETTING(Blocksize), 9, {{2000, 2048, ok}, {2049, 2048, bad_value, "(module 30)"}}},
        {SETTING(Span), 1, {{15000, 20000, ok}, {9999.5, 10000, ok}, {5000.01, 10000, ok}, {625, 625, ok},
            {600, 625, ok}, {1e-9, 20000.0 / 524288, ok}, {2500, 2500, ok}, {20000.001, 2500, bad_value},
            {-100, 2500, bad_value}, {not_a_number, 2500, bad_value}, {inf, 2500, bad_value},
            {0, 2500, bad_value, "ost7720_setSpan: span 0 Hz not above 0"},
            {30000, 2500, bad_value, "ost7720_setSpan: span 30000 Hz above the maximum 20000 Hz"}}},
        {SETTING(Range), 1, {{3, 5, ok}, {0.15, 0.2, ok}, {0, 0.1, ok}, {1, 1, ok}, {5.5, 10, ok},
            {-1, 10, bad_value}, {20, 10, bad_value, "ost7720_setRange: range 20 V above 10 V"}}},
        // A source's range is not stepped.
        {SETTING(Range), 4097, {{3, 3, ok}, {0.25, 0.25, ok}, {10.5, 0.25, bad_value}}}};
    // clang-format on
    for (const auto& run : runs) {
        for (const Step& c : run.steps) {
            SCOPED_TRACE(testing::Message() << run.channel << " <- " << c.request);
            EXPECT_EQ(run.setting.set(s, run.channel, c.request), c.status);
            EXPECT_EQ(run.setting.get(s, run.channel), c.kept);
            if (c.detail) {
                EXPECT_NE(details(s).find(c.detail), std::string::npos) << details(s);
            }
        }
    }
    EXPECT_EQ(ost7720_setBlocksize(s, 4097, 1024), sim::err_wrong_channel_type);
    EXPECT_EQ(ost7720_setRange(s, 8193, 1.0), sim::err_wrong_channel_type);
}

TEST(SimSettings, EverySettingPowersOnKeepsValidValuesRefusesOthersAndComesBackWithPreset) {
    sim::reset();
    int32_t s = simtest::open_both();  // module 16 first: source 4097 is module 16's, 4098 module 8's
    // The lowest module's source powers on active in Sine at 1 kHz, 1 V, Normal: a first Go shows it.
    // clang-format off
    const struct { Setting setting; int32_t channel; double power_on, good, bad; int32_t status; } cases[] = {
        {SETTING(Active), 4098, 420, 421, 422, bad_code}, {SETTING(Active), 4097, 421, 420, 0, bad_code},
        {SETTING(Active), 16, 420, 421, 419, bad_code}, {SETTING(SourceMode), 4098, 170, 177, 178, bad_code},
        {SETTING(SourceOutput), 4098, 700, 704, 705, bad_code},
        {SETTING(Range), 4098, 1.0, 3.0, 10.5, bad_value},
        {SETTING(SineFreq), 4098, 1000, 25600, 25601, bad_value},
        {SETTING(SinePhase), 4098, 0, -360, -361, bad_value},
        {SETTING(RampRate), 4098, 0, 2.5, 100.5, bad_value},
        {SETTING(DutyCycle), 4098, 1.0, 0.25, 1.5, bad_value},
        {SETTING(SourceSum), 4098, 190, 191, 192, bad_code},
        {SETTING(SourceCola), 4098, 180, 181, 182, bad_code},
        {SETTING(SourceSeed), 4098, 1, 255, 256, bad_value},
        {SETTING(TriggerChannel), 8194, 421, 420, 422, bad_code},
        {SETTING(TriggerChannel), 16, 421, 420, 0, bad_code},
        {SETTING(Blocksize), 16, 1024, 4096, 0, bad_value},
        {SETTING(Span), 16, 20000, 2500, 30000, bad_value}, {SETTING(Range), 16, 2.0, 10, 20, bad_value},
        {SETTING(Coupling), 16, 101, 100, 102, bad_code},
        {SETTING(AntiAliasDigital), 16, 615, 616, 617, bad_code},
        {SETTING(InputMode), 16, 130, 134, 135, bad_code},
        {SETTING(TriggerSlope), 16, 410, 411, 412, bad_code},
        {SETTING(TriggerMode), 16, 414, 415, 416, bad_code}};
    // clang-format on
    auto expect_power_on = [&] {
        for (const auto& c : cases)
            EXPECT_EQ(c.setting.get(s, c.channel), c.power_on) << c.channel << ": " << c.power_on;
        double lower = 0, upper = 0;
        ost7720_getTriggerLevel(s, 16, 416, &lower);
        ost7720_getTriggerLevel(s, 16, 417, &upper);
        EXPECT_EQ(lower, 5.0);
        EXPECT_EQ(upper, 10.0);
    };
    expect_power_on();
    for (const auto& c : cases) {
        SCOPED_TRACE(testing::Message() << c.channel << " <- " << c.good << ", " << c.bad);
        EXPECT_EQ(c.setting.set(s, c.channel, c.good), ok);
        EXPECT_EQ(c.setting.set(s, c.channel, c.bad), c.status);
        EXPECT_EQ(c.setting.get(s, c.channel), c.good);
    }
    EXPECT_EQ(ost7720_setRampRate(s, 4098, -1), bad_value);
    EXPECT_EQ(ost7720_setDutyCycle(s, 4098, not_a_number), bad_value);
    ASSERT_EQ(ost7720_setTriggerLevel(s, 16, 416, -50), 0);
    ASSERT_EQ(ost7720_setCoupling(s, 3, 100), 0);
    for (int32_t ch : {16, 4097, 4098, 8194})
        ASSERT_EQ(ost7720_preset(s, ch), 0);
    expect_power_on();
    EXPECT_EQ(get(ost7720_getCoupling, s, 3), 100);  // not preset
    EXPECT_EQ(ost7720_preset(s, 99), sim::err_invalid_channel);

    // Opening without reset keeps the settings; with reset restores them.
    int32_t keep = 0, fresh = 0;
    ASSERT_EQ(ost7720_init("VXI0::16,8::INSTR", 1, 0, &keep), 0);
    EXPECT_EQ(get(ost7720_getCoupling, keep, 3), 100);
    ASSERT_EQ(ost7720_init("VXI0::16::INSTR", 1, 1, &fresh), 0);
    EXPECT_EQ(get(ost7720_getCoupling, keep, 3), 101);

    // With no source on the lowest module, the next module's first source is the one that is on.
    sim::reset({{4, 8, 0, 0, 8}, {9, 8, 2, 0, 8}});
    ASSERT_EQ(ost7720_init("VXI0::9,4::INSTR", 1, 1, &s), 0);
    EXPECT_EQ(get(ost7720_getActive, s, 4097), 420);
    EXPECT_EQ(get(ost7720_getActive, s, 4098), 421);
}

TEST(SimSettings, LevelsDataKindsAndWriteOnlySettingsAreCheckedAndRefusalsNamed) {
    sim::reset();
    int32_t s = simtest::open_both(), time = 0, frequency = 0;
    double lower = 0, upper = 0;
    ASSERT_EQ(ost7720_setTriggerLevel(s, 5, 416, 40), ok);
    ASSERT_EQ(ost7720_setTriggerLevel(s, 5, 417, 50), ok);
    EXPECT_EQ(ost7720_setTriggerLevel(s, 5, 418, 0.0), bad_code);
    EXPECT_EQ(ost7720_setTriggerLevel(s, 5, 417, 100.5), bad_value);
    EXPECT_EQ(details(s), "ost7720_setTriggerLevel: trigger level 100.5 % not in -100..100");
    ost7720_getTriggerLevel(s, 5, 416, &lower);
    ost7720_getTriggerLevel(s, 5, 417, &upper);
    EXPECT_EQ(lower, 40);
    EXPECT_EQ(upper, 50);
    ASSERT_EQ(ost7720_setEnable(s, 5, 271, 280), ok);
    ASSERT_EQ(ost7720_setEnable(s, 5, 270, 281), ok);
    EXPECT_EQ(ost7720_setEnable(s, 5, 272, 280), bad_code);
    EXPECT_EQ(ost7720_setEnable(s, 5, 270, 282), bad_code);
    ost7720_getEnable(s, 5, 270, &time);
    ost7720_getEnable(s, 5, 271, &frequency);
    EXPECT_EQ(time, 281);
    EXPECT_EQ(frequency, 280);
    // Settings the panel writes but never reads back.
    // clang-format off
    const std::tuple<decltype(&ost7720_setWindow), int32_t, int32_t> write_only[] = {
        {ost7720_setDataMode, 341, 342}, {ost7720_setCalcData, 725, 726}, {ost7720_setAvgMode, 703, 704},
        {ost7720_setWindow, 712, 713}, {ost7720_setArmMode, 431, 432}, {ost7720_setAutoTrigger, 441, 442}};
    // clang-format on
    for (const auto& [set, good, bad] : write_only) {
        EXPECT_EQ(set(s, 5, good), ok) << good;
        EXPECT_EQ(set(s, 5, bad), bad_code) << bad;
    }
    EXPECT_EQ(ost7720_setAvgNumber(s, 5, 0), bad_value);

    EXPECT_EQ(ost7720_setSineFreq(s, 4097, 25601), bad_value);
    EXPECT_EQ(details(s), "ost7720_setSineFreq: sine frequency 25601 not in 0..25600");
    EXPECT_EQ(ost7720_setCoupling(s, 1, 102), bad_code);
    EXPECT_EQ(details(s), "ost7720_setCoupling: coupling code 102 unknown");
    EXPECT_EQ(ost7720_setSineFreq(s, 1, 100), sim::err_wrong_channel_type);
    EXPECT_EQ(details(s), "ost7720_setSineFreq: channel 1 is an input; the call takes sources");
    EXPECT_EQ(ost7720_setCoupling(s, 8193, 100), sim::err_wrong_channel_type);
    EXPECT_EQ(ost7720_setCoupling(s, 17, 100), sim::err_invalid_channel);
    EXPECT_EQ(details(s), "ost7720_setCoupling: channel 17 is not in session " + std::to_string(s));
    EXPECT_EQ(ost7720_getCoupling(s, 5, nullptr), sim::err_null_pointer);
}
