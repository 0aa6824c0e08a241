// Drawing one block into a 900 x 150 pixel picture: plot_trace against the same drawing done
// with one line call per segment through the same PictureBox. Both must give the same pixels.
#include <QApplication>
#include <QColor>
#include <QImage>
#include <array>
#include <string>
#include <vector>

#include "bench_support.h"
#include "display/PictureBox.h"
#include "display/trace_plot.h"
#include "trace_blocks.h"

namespace {

using bench::Blocks;
using bench::blocks;
using bench::draw_plot_trace;
using bench::picture;
using bench::scale_high;
using bench::scale_low;

// The same scale, clearing and grid as plot_trace, then one line_to per sample.
void draw_per_segment(PictureBox& pic, const std::vector<float>& xs, const std::vector<double>& ys,
                      int32_t n) {
    const double w = n, h = scale_high - scale_low, x1 = 0, y1 = scale_high;
    const double xl = x1 - 0.01 * w, xr = x1 + 1.01 * w, yt = y1 + 0.01 * h, yb = y1 - 1.01 * h;
    const QColor grey(128, 128, 128);
    pic.set_scale(xl, yt, xr, yb);
    pic.clear();
    for (int k = 0; k < 8; ++k) {
        const double y = yt - k * h / 8;
        pic.line(xl, y, xr, y, grey);
    }
    for (int k = 0; k < 10; ++k) {
        const double x = xl + k * w / 10;
        pic.line(x, yt, x, yb, grey);
    }
    pic.set_current(xs[0], clamp_value(ys[0], yb, yt));
    for (int32_t k = 0; k < n; ++k)
        pic.line_to(xs[k], clamp_value(ys[k], yb, yt));
}

template <auto Draw>
void BM_draw(benchmark::State& state) {
    const auto n = static_cast<int32_t>(state.range(0));
    const Blocks& b = blocks(n);
    PictureBox& pic = picture();
    size_t next = 0;
    for (auto _ : state) {
        Draw(pic, b.xs, b.ys[next], n);
        next = (next + 1) % b.ys.size();
        benchmark::DoNotOptimize(pic.image().constBits());
    }
    state.SetItemsProcessed(state.iterations() * n);
}

void BM_plot_trace(benchmark::State& state) {
    BM_draw<draw_plot_trace>(state);
}
void BM_per_segment(benchmark::State& state) {
    BM_draw<draw_per_segment>(state);
}

BENCHMARK(BM_plot_trace)->Arg(1024)->Arg(16384)->Arg(65536)->Unit(benchmark::kMicrosecond);
BENCHMARK(BM_per_segment)->Arg(1024)->Arg(16384)->Arg(65536)->Unit(benchmark::kMicrosecond);

// Every block of every size, drawn both ways, gives the same image.
void check_same_pixels() {
    PictureBox& pic = picture();
    for (int32_t n : bench::block_sizes) {
        const Blocks& b = blocks(n);
        for (size_t s = 0; s < b.ys.size(); ++s) {
            draw_plot_trace(pic, b.xs, b.ys[s], n);
            const QImage fast = pic.image().copy();
            draw_per_segment(pic, b.xs, b.ys[s], n);
            const QImage& reference = pic.image();
            if (fast.size() != QSize(bench::picture_width, bench::picture_height) || fast != reference)
                bench::fail("plot_trace and per-segment drawing differ for n = " + std::to_string(n));
        }
    }
}

}  // namespace

int main(int argc, char** argv) {
    bench::use_offscreen_platform();
    QApplication app(argc, argv);
    check_same_pixels();
    bench::Timings timings;
    if (!bench::run_all(argc, argv, timings))
        return 1;
    for (int32_t n : bench::block_sizes) {
        const std::string arg = "/" + std::to_string(n);
        const double fast = timings.seconds("BM_plot_trace" + arg);
        const double slow = timings.seconds("BM_per_segment" + arg);
        bench::print_figure("trace_draw_vs_per_segment", "plot_trace_ms_n" + std::to_string(n), fast * 1e3);
        bench::print_figure("trace_draw_vs_per_segment", "per_segment_ms_n" + std::to_string(n), slow * 1e3);
        bench::print_figure("trace_draw_vs_per_segment", "ratio_n" + std::to_string(n),
                            bench::ratio(fast, slow));
    }
    bench::print_ratio("trace_draw_vs_per_segment", bench::ratio(timings.seconds("BM_plot_trace/65536"),
                                                                 timings.seconds("BM_per_segment/65536")));
    return 0;
}
