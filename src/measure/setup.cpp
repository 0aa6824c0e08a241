#include "core/dialogs.h"
#include "core/global.h"
#include "core/shutdown.h"
#include "measure/measurement.h"
#include "ost7720.h"

namespace {

// Driver codes of the measurement set-up.
constexpr int32_t channel_active = 420;
constexpr int32_t channel_inactive = 421;
constexpr int32_t data_block = 340;
constexpr int32_t data_continuous = 341;
constexpr int32_t calc_time = 724;
constexpr int32_t calc_frequency = 725;
constexpr int32_t kind_time = 270;
constexpr int32_t kind_frequency = 271;
constexpr int32_t enable_on = 280;
constexpr int32_t enable_off = 281;
constexpr int32_t avg_time = 700;
constexpr int32_t avg_frequency = 703;
constexpr int32_t window_frequency = 711;
constexpr int32_t arm_single = 431;
constexpr int32_t arm_multi = 430;
constexpr int32_t auto_trigger_on = 441;
constexpr int32_t auto_trigger_off = 440;
constexpr int32_t first_source_id = 4097;

void check(const char* name) {
    if (global::status != 0)
        report_driver_error(name, global::status);
}

void show_span_refused() {
    dialogs::notice(
        "The selected span is too high\r\n"
        "Return to the MEAS page and select a lower span\r\n"
        "Maximum spans supported by this soft front panel\r\n"
        "K7720 = 20000,  K7740 = 76800\r\n");
}

void set_domain_processing() {
    using namespace global;
    const int32_t g = group_inputs;
    if (domain == 0) {
        status = ost7720_setCalcData(session, g, calc_time);
        check("ost7720_setCalcData");
        status = ost7720_setEnable(session, g, kind_frequency, enable_off);
        check("ost7720_setEnable");
        status = ost7720_setEnable(session, g, kind_time, enable_on);
        check("ost7720_setEnable");
        status = ost7720_setAvgMode(session, g, avg_time);
        check("ost7720_setAvgMode");
        status = ost7720_setAvgNumber(session, g, 1);
        check("ost7720_setAvgNumber");
    } else if (domain == 1) {
        status = ost7720_setCalcData(session, g, calc_frequency);
        check("ost7720_setCalcData");
        status = ost7720_setEnable(session, g, kind_frequency, enable_on);
        check("ost7720_setEnable");
        status = ost7720_setEnable(session, g, kind_time, enable_off);
        check("ost7720_setEnable");
        status = ost7720_setAvgMode(session, g, avg_frequency);
        check("ost7720_setAvgMode");
        status = ost7720_setAvgNumber(session, g, 1);
        check("ost7720_setAvgNumber");
        status = ost7720_setAvgUpdate(session, g, 1);
        check("ost7720_setAvgUpdate");
        status = ost7720_setWindow(session, g, window_frequency);
        check("ost7720_setWindow");
    }
}

void arm_across_mainframes() {
    using namespace global;
    // The last input sits on the last module of the resource list: it leads.
    const int32_t master = num_inputs;
    const int32_t slave = num_inputs > 0 ? 1 : first_source_id;
    status = ost7720_armMeasureMasterSetup(session, master);
    check("ost7720_armMeasureMasterSetup");
    status = ost7720_armMeasure(session, group_all, 0);
    check("ost7720_armMeasure");
    status = ost7720_armMeasureSlaveFinish(session, slave);
    check("ost7720_armMeasureSlaveFinish");
    status = ost7720_armMeasureMasterFinish(session, master);
    check("ost7720_armMeasureMasterFinish");
}

}  // namespace

void setup_measurement() {
    using namespace global;
    check_trigger_setup();

    status = ost7720_setBlocksize(session, group_inputs, blocksize);
    check("ost7720_setBlocksize");
    status = ost7720_getBlocksize(session, group_inputs, &blocksize);
    check("ost7720_getBlocksize");
    status = ost7720_setSpan(session, group_inputs, span);
    if (status != 0)
        show_span_refused();
    status = ost7720_getSpan(session, group_inputs, &span);
    check("ost7720_getSpan");
    num_points = blocksize;

    status = ost7720_setActive(session, group_inputs, channel_inactive);
    check("ost7720_setActive");
    status = ost7720_setActive(session, group_tachs, channel_inactive);
    check("ost7720_setActive");
    status = ost7720_setActive(session, group_inputs, channel_active);
    check("ost7720_setActive");

    status =
        ost7720_setDataMode(session, group_inputs, block_mode == flag_true ? data_block : data_continuous);
    check("ost7720_setDataMode");
    set_domain_processing();

    if (multi_mainframe == 0 || multi_mainframe == 1) {
        status = ost7720_setArmMode(session, group_all, multi_mainframe == 0 ? arm_single : arm_multi);
        check("ost7720_setArmMode");
    }
    if (trigger_source >= 0 && trigger_source <= 3) {
        status = ost7720_setAutoTrigger(session, group_all,
                                        trigger_source == 0 ? auto_trigger_on : auto_trigger_off);
        check("ost7720_setAutoTrigger");
    }
    status = ost7720_initMeasure(session, group_all);
    check("ost7720_initMeasure");
    if (multi_mainframe == 1)
        arm_across_mainframes();
}
