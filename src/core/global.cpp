#include "core/global.h"

namespace global {

std::vector<double>& trace_data(int t) {
    switch (t) {
        case 0:
            return trace1_data;
        case 1:
            return trace2_data;
        case 2:
            return trace3_data;
        default:
            return trace4_data;
    }
}

void set_defaults() {
    for (int t = 0; t <= 3; ++t) {
        trace_channel[t] = 0;
        trace_high[t] = 1.0;
        trace_low[t] = -1.0;
        trace_has_data[t] = flag_false;
    }
    single_block = flag_true;
    block_mode = flag_true;
    all_channels_match = flag_true;
    num_points = 0;
    trigger_source = 0;
    blocksize = 1024;
    span = 20000.0;
    domain = 0;
    running = flag_false;
    session = 0;
    group_all = 0;
    group_inputs = 0;
    group_sources = 0;
    group_tachs = 0;
    status = 0;
    for (int t = 0; t <= 3; ++t)
        trace_file[t].clear();
    multi_mainframe = 0;
}

}  // namespace global
