#include <algorithm>
#include <cmath>
#include <vector>

#include "core/global.h"
#include "core/shutdown.h"
#include "measure/measurement.h"
#include "ost7720.h"
#include "ost7720_codes.h"

namespace {

namespace code = ost7720_code;

// Received data for channels no trace shows; kept between blocks so the read does not
// allocate each time. Its contents are never looked at.
std::vector<double>& scratch() {
    static std::vector<double> data;
    return data;
}

// Copies slot `from` into slot `to` (samples 0..n-1, range and flag).
void copy_trace(int from, int to, int32_t n) {
    using namespace global;
    const auto& src = trace_data(from);
    std::copy_n(src.begin(), n, trace_data(to).begin());
    trace_range[to] = trace_range[from];
    trace_has_data[to] = trace_has_data[from];
}

}  // namespace

void read_block() {
    using namespace global;
    const bool frequency = domain == 1;
    const int32_t kind = frequency ? code::kind_frequency : code::kind_time;
    const int32_t data_type = frequency ? code::read_frequency : code::read_time;
    const int32_t points = std::max(num_points, 0);
    // Half the points for a spectrum, an exact half going to the even neighbour.
    const auto n = static_cast<int32_t>(frequency ? std::nearbyint(points / 2.0) : points);

    for (int t = 0; t <= 3; ++t)
        trace_data(t).assign(points + 1, 0.0);
    scratch().assign(points + 1, 0.0);
    x_values.assign(points + 1, 0.0f);
    for (int t = 0; t <= 3; ++t)
        trace_has_data[t] = flag_false;

    for (int32_t c = 0; c < num_inputs && static_cast<size_t>(c) < input_ids.size(); ++c) {
        const int32_t id = input_ids[c];
        int32_t state = 0;
        status = ost7720_getEnable(session, id, kind, &state);
        driver_ok("ost7720_getEnable");
        if (state != code::enable_on)
            continue;

        const auto shown = std::find(trace_channel.begin(), trace_channel.begin() + 4, id);
        const int t = static_cast<int>(shown - trace_channel.begin());
        std::vector<double>& target = t < 4 ? trace_data(t) : scratch();
        int32_t count = 0;
        status = ost7720_readFloat64Data(session, id, data_type, target.data(), n, &count, 1);
        driver_ok("ost7720_readFloat64Data");
        if (t < 4) {
            trace_has_data[t] = flag_true;
            double range = 0;
            status = ost7720_getRange(session, trace_channel[t], &range);
            driver_ok("ost7720_getRange");
            trace_range[t] = range;
        }
    }

    // Traces that show a channel already read by a lower trace get a copy.
    for (int t = 1; t <= 3; ++t) {
        if (trace_has_data[t] == flag_true)
            continue;
        for (int from = 0; from < t; ++from) {
            if (trace_channel[from] == trace_channel[t]) {
                copy_trace(from, t, n);
                break;
            }
        }
    }

    for (int32_t i = 0; i < points; ++i)
        x_values[i] = static_cast<float>(i + 1);
}
