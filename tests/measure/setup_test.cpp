// Measurement set-up: the calls sent for the settings, read-back, arming and trigger warnings.
#include <gtest/gtest.h>

#include "core/global.h"
#include "core/startup.h"
#include "measure/measurement.h"
#include "ost7720.h"
#include "panel_fixture.h"

namespace {

using Names = std::vector<std::string>;
using Args = std::vector<std::string>;

class SetupTest : public PanelTest {
  protected:
    void SetUp() override {
        PanelTest::SetUp();
        start();
    }
    // Discovery and the session, without windows.
    void start() {
        global::interface_name = "VXI0";
        int32_t found = 0;
        std::vector<int32_t> addresses(51);
        std::string name(50, ' ');
        ASSERT_EQ(ost7720_find(0, addresses.data(), 50, &found, name.data(), 10), 0);
        global::module_count = found;
        global::module_address.assign(addresses.begin(), addresses.begin() + found + 1);
        global::module_use.assign(found + 1, global::flag_true);
        open_session();
        sim::clear_call_log();
    }
    // The arguments of the last call of this function after the session, "none" when not called.
    static Args last_args(const std::string& name) {
        const auto& log = sim::call_log();
        const auto it =
            std::find_if(log.rbegin(), log.rend(), [&](const sim::Call& c) { return c.name == name; });
        return it == log.rend() ? Args{"none"} : Args(it->args.begin() + 1, it->args.end());
    }
    static Names last_calls(size_t n) {
        const Names names = sim::call_names();
        return Names(names.end() - std::min(n, names.size()), names.end());
    }
};

TEST_F(SetupTest, DefaultsSendTheTimeDomainSequenceWithTheirCodes) {
    setup_measurement();
    const std::string inputs = std::to_string(global::group_inputs), all = std::to_string(global::group_all);
    const std::string tachs = std::to_string(global::group_tachs);
    const std::vector<std::pair<std::string, Args>> expected = {
        {"ost7720_setBlocksize", {inputs, "1024"}},    {"ost7720_getBlocksize", {inputs}},
        {"ost7720_setSpan", {inputs, "20000"}},        {"ost7720_getSpan", {inputs}},
        {"ost7720_setActive", {inputs, "421"}},        {"ost7720_setActive", {tachs, "421"}},
        {"ost7720_setActive", {inputs, "420"}},        {"ost7720_setDataMode", {inputs, "340"}},
        {"ost7720_setCalcData", {inputs, "724"}},      {"ost7720_setEnable", {inputs, "271", "281"}},
        {"ost7720_setEnable", {inputs, "270", "280"}}, {"ost7720_setAvgMode", {inputs, "700"}},
        {"ost7720_setAvgNumber", {inputs, "1"}},       {"ost7720_setArmMode", {all, "431"}},
        {"ost7720_setAutoTrigger", {all, "441"}},      {"ost7720_initMeasure", {all}}};
    const auto& log = sim::call_log();
    ASSERT_EQ(log.size(), expected.size()) << testing::PrintToString(sim::call_names());
    for (size_t i = 0; i < log.size(); ++i) {
        Args args = expected[i].second;
        args.insert(args.begin(), std::to_string(global::session));
        EXPECT_EQ(log[i].name, expected[i].first);
        EXPECT_EQ(log[i].args, args) << log[i].line();
    }
    EXPECT_EQ(global::num_points, 1024);
    EXPECT_TRUE(messages.empty());
}

TEST_F(SetupTest, FrequencyDomainContinuousManualSendsTheirCodes) {
    global::domain = 1;
    global::block_mode = global::flag_false;
    global::trigger_source = 1;
    setup_measurement();
    EXPECT_EQ(last_calls(11), (Names{"ost7720_setDataMode", "ost7720_setCalcData", "ost7720_setEnable",
                                     "ost7720_setEnable", "ost7720_setAvgMode", "ost7720_setAvgNumber",
                                     "ost7720_setAvgUpdate", "ost7720_setWindow", "ost7720_setArmMode",
                                     "ost7720_setAutoTrigger", "ost7720_initMeasure"}));
    EXPECT_EQ(last_args("ost7720_setDataMode").back(), "341");
    EXPECT_EQ(last_args("ost7720_setCalcData").back(), "725");
    EXPECT_EQ(last_args("ost7720_setAvgMode").back(), "703");
    EXPECT_EQ(last_args("ost7720_setWindow").back(), "711");
    EXPECT_EQ(last_args("ost7720_setAutoTrigger").back(), "440");
}

TEST_F(SetupTest, AcceptedBlockSizeAndSpanAreReadBackAndARefusedSpanGivesTheSpanMessage) {
    global::blocksize = 1000;
    global::span = 15000;
    setup_measurement();
    EXPECT_EQ(global::blocksize, 1024);
    EXPECT_EQ(global::num_points, 1024);
    EXPECT_EQ(global::span, 20000.0);
    EXPECT_TRUE(messages.empty());

    global::span = 5000;
    setup_measurement();
    ASSERT_EQ(global::span, 5000.0);
    global::span = 76800;
    setup_measurement();
    ASSERT_EQ(messages.size(), 1u);
    EXPECT_EQ(messages[0].kind, dialogs::Kind::notice);
    EXPECT_EQ(messages[0].text,
              "The selected span is too high\r\n"
              "Return to the MEAS page and select a lower span\r\n"
              "Maximum spans supported by this soft front panel\r\n"
              "K7720 = 20000,  K7740 = 76800\r\n");
    EXPECT_EQ(global::span, 5000.0);  // what the module kept
}

TEST_F(SetupTest, YesToAReportGoesOnWithTheNextCall) {
    sim::fail("ost7720_setBlocksize", -1074003951, 1);
    setup_measurement();
    ASSERT_EQ(messages.size(), 1u);
    EXPECT_NE(messages[0].text.find("ost7720_setBlocksize returned -1074003951"), std::string::npos);
    const Names names = sim::call_names();
    EXPECT_EQ(std::count(names.begin(), names.end(), "ost7720_getBlocksize"), 1);
    EXPECT_EQ(sim::call_names().back(), "ost7720_initMeasure");
}

TEST_F(SetupTest, MultiMainframeArmsMasterOnLastInputAndSlaveOnFirstOrOnTheFirstSource) {
    global::multi_mainframe = 1;
    setup_measurement();
    EXPECT_EQ(last_calls(5),
              (Names{"ost7720_initMeasure", "ost7720_armMeasureMasterSetup", "ost7720_armMeasure",
                     "ost7720_armMeasureSlaveFinish", "ost7720_armMeasureMasterFinish"}));
    EXPECT_EQ(last_args("ost7720_setArmMode").back(), "430");
    EXPECT_EQ(last_args("ost7720_armMeasureMasterSetup").at(0), "16");
    EXPECT_EQ(last_args("ost7720_armMeasure").at(1), "0");
    EXPECT_EQ(last_args("ost7720_armMeasureSlaveFinish").at(0), "1");
    EXPECT_EQ(last_args("ost7720_armMeasureMasterFinish").at(0), "16");

    // Without inputs the master is channel 0 and the slave the first source.
    use_system({{8, 0, 1, 0, 8}});
    start();
    global::multi_mainframe = 1;
    setup_measurement();
    EXPECT_EQ(last_args("ost7720_armMeasureMasterSetup").at(0), "0");
    EXPECT_EQ(last_args("ost7720_armMeasureSlaveFinish").at(0), "4097");
}

// Trigger warnings

const std::string S1 =
    "WARNING:\r\nSource triggering has been selected, but no sources have been set to trigger\r\n"
    "You may want to turn on source triggering in the Source page.";
const std::string S2 =
    "WARNING:\r\nSource triggering has been selected, but some inputs have been set to trigger.\r\n"
    "You may want to turn off channel triggering in the Input page.";
const std::string I1 =
    "WARNING:\r\nInput triggering has been selected, but no inputs have been set to trigger\r\n"
    "You may want to turn on channel triggering in the Input page.";
const std::string I2 =
    "WARNING:\r\nInput triggering has been selected, but some sources have been set to trigger.\r\n"
    "You may want to turn off channel triggering in the Source page.";
const std::string M1 =
    "WARNING:\r\nManual triggering has been selected, but some input channels have been set to trigger\r\n"
    "\r\nYou may want to turn off channel triggering in the Input page.";
const std::string M2 =
    "WARNING:\r\nManual triggering has been selected, but some sources have been set to trigger.\r\n"
    "You may want to turn off channel triggering in the Source page.";
const std::string gap = "\r\n\r\n\r\n";

class TriggerWarningTest : public SetupTest {
  protected:
    void set_trigger(int32_t channel, bool on) {
        ASSERT_EQ(ost7720_setTriggerChannel(global::session, channel, on ? 420 : 421), 0);
    }
    void all_off() {
        for (int32_t i = 0; i < global::num_inputs; ++i)
            set_trigger(global::input_ids[i], false);
        for (int32_t i = 0; i < global::num_sources; ++i)
            set_trigger(global::source_ids[i], false);
        sim::clear_call_log();
    }
    // The one box's text, "" when none shows.
    std::string warnings() {
        messages.clear();
        check_trigger_setup();
        EXPECT_LE(messages.size(), 1u);
        EXPECT_TRUE(messages.empty() || messages[0].kind == dialogs::Kind::notice);
        return messages.empty() ? "" : messages[0].text;
    }
};

TEST_F(TriggerWarningTest, EachTriggerSourceWarnsAboutItsContradictions) {
    all_off();
    global::trigger_source = 0;
    EXPECT_EQ(warnings(), "");
    EXPECT_TRUE(sim::call_log().empty());  // Auto asks nothing

    global::trigger_source = 3;
    EXPECT_EQ(warnings(), S1);
    EXPECT_EQ(sim::call_log().size(), size_t(global::num_sources + global::num_inputs));
    set_trigger(4098, true);
    set_trigger(3, true);
    EXPECT_EQ(warnings(), S2);

    global::trigger_source = 2;
    EXPECT_EQ(warnings(), I2);
    set_trigger(3, false);
    EXPECT_EQ(warnings(), I1 + gap + I2);

    global::trigger_source = 1;
    EXPECT_EQ(warnings(), M2);
    set_trigger(16, true);
    EXPECT_EQ(warnings(), M1 + gap + M2);

    // A system without sources asks only its inputs.
    use_system({{8, 4, 0, 0, 8}});
    start();
    all_off();
    global::trigger_source = 3;
    EXPECT_EQ(warnings(), S1);
    EXPECT_EQ(sim::call_log().size(), 4u);
}

}  // namespace
