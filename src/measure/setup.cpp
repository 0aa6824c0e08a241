#include "core/dialogs.h"
#include "core/global.h"
#include "core/shutdown.h"
#include "measure/measurement.h"
#include "ost7720.h"
#include "ost7720_codes.h"

namespace {

namespace code = ost7720_code;
constexpr int32_t first_source_id = 4097;

void show_span_refused() {
    dialogs::notice(
        "The selected span is too high\r\n"
        "Return to the MEAS page and select a lower span\r\n"
        "Maximum spans supported by this soft front panel\r\n"
        "K7720 = 20000,  K7740 = 76800\r\n");
}

// Time processing delivers only time data, frequency processing only (Hann-windowed) spectra;
// both average one block.
void set_domain_processing() {
    using namespace global;
    if (domain != 0 && domain != 1)
        return;
    const bool frequency = domain == 1;
    const int32_t g = group_inputs;
    status = ost7720_setCalcData(session, g, frequency ? code::calc_frequency : code::calc_time);
    driver_ok("ost7720_setCalcData");
    status =
        ost7720_setEnable(session, g, code::kind_frequency, frequency ? code::enable_on : code::enable_off);
    driver_ok("ost7720_setEnable");
    status = ost7720_setEnable(session, g, code::kind_time, frequency ? code::enable_off : code::enable_on);
    driver_ok("ost7720_setEnable");
    status = ost7720_setAvgMode(session, g, frequency ? code::avg_frequency : code::avg_time);
    driver_ok("ost7720_setAvgMode");
    status = ost7720_setAvgNumber(session, g, 1);
    driver_ok("ost7720_setAvgNumber");
    if (!frequency)
        return;
    status = ost7720_setAvgUpdate(session, g, 1);
    driver_ok("ost7720_setAvgUpdate");
    status = ost7720_setWindow(session, g, code::window_hann);
    driver_ok("ost7720_setWindow");
}

void arm_across_mainframes() {
    using namespace global;
    // The last input sits on the last module of the resource list: it leads.
    const int32_t master = num_inputs;
    const int32_t slave = num_inputs > 0 ? 1 : first_source_id;
    status = ost7720_armMeasureMasterSetup(session, master);
    driver_ok("ost7720_armMeasureMasterSetup");
    status = ost7720_armMeasure(session, group_all, 0);
    driver_ok("ost7720_armMeasure");
    status = ost7720_armMeasureSlaveFinish(session, slave);
    driver_ok("ost7720_armMeasureSlaveFinish");
    status = ost7720_armMeasureMasterFinish(session, master);
    driver_ok("ost7720_armMeasureMasterFinish");
}

}  // namespace

void setup_measurement() {
    using namespace global;
    check_trigger_setup();

    status = ost7720_setBlocksize(session, group_inputs, blocksize);
    driver_ok("ost7720_setBlocksize");
    status = ost7720_getBlocksize(session, group_inputs, &blocksize);
    driver_ok("ost7720_getBlocksize");
    status = ost7720_setSpan(session, group_inputs, span);
    if (status != 0)
        show_span_refused();
    status = ost7720_getSpan(session, group_inputs, &span);
    driver_ok("ost7720_getSpan");
    num_points = blocksize;

    // All inputs end active, all tachometers inactive; sources are not touched.
    status = ost7720_setActive(session, group_inputs, code::off);
    driver_ok("ost7720_setActive");
    status = ost7720_setActive(session, group_tachs, code::off);
    driver_ok("ost7720_setActive");
    status = ost7720_setActive(session, group_inputs, code::on);
    driver_ok("ost7720_setActive");

    status = ost7720_setDataMode(session, group_inputs,
                                 block_mode == flag_true ? code::data_block : code::data_continuous);
    driver_ok("ost7720_setDataMode");
    set_domain_processing();

    if (multi_mainframe == 0 || multi_mainframe == 1) {
        status =
            ost7720_setArmMode(session, group_all, multi_mainframe == 0 ? code::arm_single : code::arm_multi);
        driver_ok("ost7720_setArmMode");
    }
    if (trigger_source >= 0 && trigger_source <= 3) {
        status = ost7720_setAutoTrigger(session, group_all,
                                        trigger_source == 0 ? code::auto_trigger_on : code::auto_trigger_off);
        driver_ok("ost7720_setAutoTrigger");
    }
    status = ost7720_initMeasure(session, group_all);
    driver_ok("ost7720_initMeasure");
    if (multi_mainframe == 1)
        arm_across_mainframes();
}
