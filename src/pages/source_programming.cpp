// Writing the Source Setup page's settings to the module: setupsource and the arbitrary test
// waveform it downloads.
#include <cmath>
#include <optional>
#include <string>
#include <utility>

#include "core/dialogs.h"
#include "core/global.h"
#include "core/number_text.h"
#include "core/shutdown.h"
#include "ost7720.h"
#include "pages/SrcFrm.h"
#include "pages/source_programming.h"

namespace {

constexpr double arb_full_scale = 2147000000.0;
// Buffer mode, readiness check and data write of the arbitrary download all take this mode.
constexpr int32_t arb_buffer_mode = 4;
constexpr int32_t arb_buffer_init = 1;
constexpr int32_t arb_max_polls = 100000;

// The code of text among names counted from first; nothing when the text is none of them.
template <size_t N>
std::optional<int32_t> code_of(const std::string& text, const std::array<const char*, N>& names,
                               int32_t first) {
    for (size_t i = 0; i < N; ++i)
        if (text == names[i])
            return first + static_cast<int32_t>(i);
    return std::nullopt;
}

std::optional<int32_t> on_off_code(const std::string& text, int32_t on, int32_t off) {
    if (text == "On")
        return on;
    if (text == "Off")
        return off;
    return std::nullopt;
}

std::string text_of(const QComboBox* box) {
    return box->currentText().toStdString();
}

std::string text_of(const QLineEdit* box) {
    return box->text().toStdString();
}

// Sets up the source's arbitrary buffer and downloads the test waveform into it.
void download_test_waveform(int32_t channel) {
    using namespace global;
    status = ost7720_setAmpScale(session, channel, 1.0);
    driver_ok("ost7720_setAmpScale");
    status = ost7720_setSourceBlocksize(session, channel, arb_table_points);
    driver_ok("ost7720_setSourceBlocksize");
    status = ost7720_setSrcBufferSize(session, channel, arb_table_points);
    driver_ok("ost7720_setSrcBufferSize");
    status = ost7720_setSrcBufferMode(session, channel, arb_buffer_mode);
    driver_ok("ost7720_setSrcBufferMode");
    status = ost7720_setSrcBufferInit(session, channel, arb_buffer_init);
    driver_ok("ost7720_setSrcBufferInit");

    const std::array<int32_t, arb_table_points> table = arb_test_waveform();

    // The wait gives up after its last poll: a buffer that never reports ready would otherwise
    // hold the panel for good. A check that fails ends it too, after its one report, rather
    // than asking the same question a hundred thousand times.
    int32_t ready = 0;
    int32_t polls = 0;
    while (ready == 0 && polls < arb_max_polls) {
        status = ost7720_checkSrcArbRdy(session, channel, arb_buffer_mode, &ready);
        ++polls;
        if (status != 0) {
            report_driver_error("ost7720_checkSrcArbRdy", status);
            ready = 0;
            break;
        }
    }
    if (ready == 0) {
        dialogs::notice("The arbritray source is refusing to take data");
        return;
    }
    status = ost7720_writeSrcBufferData(session, channel, table.data(), arb_table_points, arb_buffer_mode);
    driver_ok("ost7720_writeSrcBufferData");
}

}  // namespace

std::array<int32_t, arb_table_points> arb_test_waveform() {
    std::array<int32_t, arb_table_points> table{};
    for (int k = 0; k < arb_table_points; ++k) {
        // k / 1024 is exact, and so is its product with the full scale: halves are true halves.
        const double value = static_cast<double>(k) / arb_table_points * arb_full_scale;
        table[static_cast<size_t>(k)] = numtext::to_int32(value).value_or(0);
    }
    constexpr size_t quarter = arb_table_points / 4;
    for (size_t i = 0; i < quarter; ++i) {
        std::swap(table[i], table[quarter + i]);
        std::swap(table[2 * quarter + i], table[3 * quarter + i]);
    }
    return table;
}

double source_limit(double value, double lower, double upper) {
    if (std::isnan(value))
        return lower;
    if (value < lower)
        return lower;
    if (value > upper)
        return upper;
    return value;
}

void SrcFrm::setupsource() {
    using namespace global;

    // 1. Source: a number that does not fit 16 bits is out of range like any other.
    cur_src = numtext::to_int16(numtext::val(text_of(SrcWhoCmbo))).value_or(0);
    if (cur_src < 1 || cur_src > num_sources)
        return;
    const int32_t channel = source_ids[static_cast<size_t>(cur_src - 1)];

    // A text that names no choice gets its message and no call: any code sent instead would
    // belong to another setting, or switch the source on or off unasked.
    auto active_code = [this]() {
        std::optional<int32_t> code = on_off_code(text_of(ActiveCmbo), srccode::on, srccode::off);
        if (!code)
            dialogs::notice("bad active string");
        return code;
    };

    // 2. Active.
    if (std::optional<int32_t> code = active_code()) {
        status = ost7720_setActive(session, channel, *code);
        driver_ok("ost7720_setActive");
    }

    // 3. Count the active sources.
    int32_t active_sources = 0;
    for (int32_t i = 1; i <= num_sources; ++i) {
        int32_t state = 0;
        status = ost7720_getActive(session, source_ids[static_cast<size_t>(i - 1)], &state);
        driver_ok("ost7720_getActive");
        if (state == srccode::on)
            ++active_sources;
    }

    // 4. At most one source may be on: all off, then the chosen one as the page says.
    if (active_sources > 1) {
        dialogs::notice(
            "Only one source can be enabled\r\n"
            "This is a limitation of this example program, not the Plug&Play library\r\n"
            "The C example \"srcgang\" can control on multiple sources\r\n"
            "\r\n"
            "Source channel " +
            numtext::text(cur_src) + " is ON, all others are OFF");
        for (int32_t i = 1; i <= num_sources; ++i) {
            status = ost7720_setActive(session, source_ids[static_cast<size_t>(i - 1)], srccode::off);
            driver_ok("ost7720_setActive");
        }
        if (std::optional<int32_t> code = active_code()) {
            status = ost7720_setActive(session, channel, *code);
            driver_ok("ost7720_setActive");
        }
    }

    // 5. Trigger.
    if (std::optional<int32_t> code = on_off_code(text_of(SrcTrigCmbo), srccode::on, srccode::off)) {
        status = ost7720_setTriggerChannel(session, channel, *code);
        driver_ok("ost7720_setTriggerChannel");
    } else {
        dialogs::notice("bad trig active string");
    }

    // 6. Mode: an unknown one becomes Sine.
    const std::string mode_text = text_of(ModeCmbo);
    std::optional<int32_t> mode = code_of(mode_text, srccode::mode_names, srccode::first_mode);
    if (!mode) {
        dialogs::notice("Unknown source mode " + mode_text + " - ignored");
        mode = srccode::first_mode;
    }
    status = ost7720_setSourceMode(session, channel, *mode);
    driver_ok("ost7720_setSourceMode");

    // 7. An active arbitrary source gets the test waveform.
    if (text_of(ActiveCmbo) == "On" &&
        (*mode == srccode::mode_arbitrary || *mode == srccode::mode_burst_arbitrary))
        download_test_waveform(channel);

    // 8. Output.
    const std::string output_text = text_of(OutputCmbo);
    if (std::optional<int32_t> code = code_of(output_text, srccode::output_names, srccode::first_output)) {
        status = ost7720_setSourceOutput(session, channel, *code);
        driver_ok("ost7720_setSourceOutput");
    } else {
        dialogs::notice("Unknown source output " + output_text + " - ignored");
    }

    // 9. Sum.
    if (std::optional<int32_t> code = on_off_code(text_of(SumCmbo), srccode::sum_on, srccode::sum_off)) {
        status = ost7720_setSourceSum(session, channel, *code);
        driver_ok("ost7720_setSourceSum");
    } else {
        dialogs::notice("bad src sum string");
    }

    // 10. Cola.
    if (std::optional<int32_t> code = on_off_code(text_of(ColaCmbo), srccode::cola_on, srccode::cola_off)) {
        status = ost7720_setSourceCola(session, channel, *code);
        driver_ok("ost7720_setSourceCola");
    } else {
        dialogs::notice("bad cola string");
    }

    // 11. Numbers, each brought within what the source takes.
    auto number = [](const QLineEdit* box, double lower, double upper) {
        return source_limit(numtext::val(text_of(box)), lower, upper);
    };
    status = ost7720_setRampRate(session, channel, number(RampRateTxt, 0, 100));
    driver_ok("ost7720_setRampRate");
    status = ost7720_setSineFreq(session, channel, number(FreqTxt, 0, 25600));
    driver_ok("ost7720_setSineFreq");
    status = ost7720_setSinePhase(session, channel, number(PhaseTxt, -360, 360));
    driver_ok("ost7720_setSinePhase");
    status = ost7720_setSourceSeed(session, channel, numtext::to_int32(number(SeedTxt, 0, 255)).value_or(0));
    driver_ok("ost7720_setSourceSeed");
    status = ost7720_setRange(session, channel, number(RangeTxt, 0, 20));
    driver_ok("ost7720_setRange");
    status = ost7720_setDutyCycle(session, channel, number(DutyTxt, 0, 1));
    driver_ok("ost7720_setDutyCycle");
}
