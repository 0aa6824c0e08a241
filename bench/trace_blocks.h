// The blocks both trace-drawing benchmarks draw, and the panel's way of drawing them.
#pragma once

#include <array>
#include <cstdint>
#include <string>
#include <vector>

#include "bench_support.h"
#include "display/PictureBox.h"
#include "display/trace_plot.h"

namespace bench {

constexpr int picture_width = 900;
constexpr int picture_height = 150;
constexpr double scale_high = 1.0;
constexpr double scale_low = -1.0;
constexpr std::array<int32_t, 3> block_sizes = {1024, 16384, 65536};

// A few different blocks per size, drawn in turn, as a running measurement delivers them.
struct Blocks {
    std::vector<float> xs;
    std::array<std::vector<double>, 4> ys;
};

inline const Blocks& blocks(int32_t n) {
    static std::array<Blocks, block_sizes.size()> all;
    for (size_t i = 0; i < block_sizes.size(); ++i) {
        if (block_sizes[i] != n)
            continue;
        Blocks& b = all[i];
        if (b.xs.empty()) {
            b.xs = sample_positions(n);
            for (size_t s = 0; s < b.ys.size(); ++s)
                b.ys[s] = noisy_sine(n, static_cast<uint32_t>(1000 + 17 * s + n));
        }
        return b;
    }
    fail("no block of " + std::to_string(n) + " samples");
}

// The picture every panel drawing goes to (hidden, as the timing is of the drawing alone).
inline PictureBox& picture() {
    static PictureBox pic;
    pic.resize(picture_width, picture_height);
    return pic;
}

// The block as the main window draws it, with the scale of a trace from -1 to 1.
inline void draw_plot_trace(PictureBox& pic, const std::vector<float>& xs, const std::vector<double>& ys,
                            int32_t n) {
    plot_trace(pic, 0, scale_high, n, scale_high - scale_low, xs.data(), ys.data(), n);
}

}  // namespace bench
