// Drawing one block into a 900 x 150 pixel picture: plot_trace against QCustomPlot, the plotting
// widget people would otherwise reach for, with its adaptive sampling on as it comes. Its axis
// rectangle fills the widget and its tick labels are off, so that it draws what the panel's
// picture holds (grid and trace); it keeps its own default pens and antialiasing. What is timed
// is what a new block costs: QCustomPlot's setData and replot into its paint buffer, against
// plot_trace into the picture's image. Linked into this benchmark only, never into the panel.
#include <qcustomplot.h>

#include <QApplication>
#include <QImage>
#include <QVector>
#include <array>
#include <map>
#include <string>

#include "bench_support.h"
#include "trace_blocks.h"

namespace {

struct QtBlocks {
    QVector<double> keys;
    std::array<QVector<double>, 4> values;
};

// The same blocks as QCustomPlot takes them (made before timing: the data would be in the
// program's own arrays either way).
const QtBlocks& qt_blocks(int32_t n) {
    static std::map<int32_t, QtBlocks> all;
    QtBlocks& q = all[n];
    if (q.keys.isEmpty()) {
        const bench::Blocks& b = bench::blocks(n);
        q.keys = QVector<double>(b.xs.begin(), b.xs.end());
        for (size_t s = 0; s < b.ys.size(); ++s)
            q.values[s] = QVector<double>(b.ys[s].begin(), b.ys[s].end());
    }
    return q;
}

// An offscreen plot of the picture's size and scale: x from -1 % to 101 % of the block, y from
// the low scale end - 1 % of the span to the high end + 1 %.
QCustomPlot& plot_for(int32_t n) {
    static QCustomPlot* plot = nullptr;
    if (plot == nullptr) {
        plot = new QCustomPlot;
        plot->resize(bench::picture_width, bench::picture_height);
        plot->addGraph();
        plot->graph(0)->setAdaptiveSampling(true);
        plot->axisRect()->setAutoMargins(QCP::msNone);
        plot->axisRect()->setMargins(QMargins(0, 0, 0, 0));
        plot->xAxis->setTickLabels(false);
        plot->yAxis->setTickLabels(false);
    }
    const double h = bench::scale_high - bench::scale_low;
    plot->xAxis->setRange(-0.01 * n, 1.01 * n);
    plot->yAxis->setRange(bench::scale_high - 1.01 * h, bench::scale_high + 0.01 * h);
    return *plot;
}

void BM_qcustomplot(benchmark::State& state) {
    const auto n = static_cast<int32_t>(state.range(0));
    const QtBlocks& b = qt_blocks(n);
    QCustomPlot& plot = plot_for(n);
    size_t next = 0;
    for (auto _ : state) {
        plot.graph(0)->setData(b.keys, b.values[next], true);
        plot.replot();
        next = (next + 1) % b.values.size();
    }
    state.SetItemsProcessed(state.iterations() * n);
}

void BM_plot_trace(benchmark::State& state) {
    const auto n = static_cast<int32_t>(state.range(0));
    const bench::Blocks& b = bench::blocks(n);
    PictureBox& pic = bench::picture();
    size_t next = 0;
    for (auto _ : state) {
        bench::draw_plot_trace(pic, b.xs, b.ys[next], n);
        next = (next + 1) % b.ys.size();
        benchmark::DoNotOptimize(pic.image().constBits());
    }
    state.SetItemsProcessed(state.iterations() * n);
}

BENCHMARK(BM_plot_trace)->Arg(1024)->Arg(16384)->Arg(65536)->Unit(benchmark::kMicrosecond);
BENCHMARK(BM_qcustomplot)->Arg(1024)->Arg(16384)->Arg(65536)->Unit(benchmark::kMicrosecond);

// QCustomPlot really draws the block here: its picture of the largest block has the trace's
// dark pixels in most columns.
void check_qcustomplot_draws() {
    const int32_t n = bench::block_sizes.back();
    QCustomPlot& plot = plot_for(n);
    plot.graph(0)->setData(qt_blocks(n).keys, qt_blocks(n).values[0], true);
    plot.replot();
    const QImage img = plot.toPixmap(bench::picture_width, bench::picture_height).toImage();
    int columns = 0;
    for (int x = 0; x < img.width(); ++x) {
        bool dark = false;
        for (int y = 0; y < img.height() && !dark; ++y)
            dark = qGray(img.pixel(x, y)) < 64;
        columns += dark;
    }
    if (columns < bench::picture_width * 9 / 10)
        bench::fail("QCustomPlot drew the trace in only " + std::to_string(columns) + " columns");
}

}  // namespace

int main(int argc, char** argv) {
    bench::use_offscreen_platform();
    QApplication app(argc, argv);
    check_qcustomplot_draws();
    bench::Timings timings;
    if (!bench::run_all(argc, argv, timings))
        return 1;
    for (int32_t n : bench::block_sizes) {
        const std::string arg = "/" + std::to_string(n);
        const double panel = timings.seconds("BM_plot_trace" + arg);
        const double other = timings.seconds("BM_qcustomplot" + arg);
        bench::print_figure("trace_draw_vs_qcustomplot", "plot_trace_ms_n" + std::to_string(n), panel * 1e3);
        bench::print_figure("trace_draw_vs_qcustomplot", "qcustomplot_ms_n" + std::to_string(n), other * 1e3);
        bench::print_figure("trace_draw_vs_qcustomplot", "ratio_n" + std::to_string(n),
                            bench::ratio(panel, other));
    }
    bench::print_ratio("trace_draw_vs_qcustomplot", bench::ratio(timings.seconds("BM_plot_trace/65536"),
                                                                 timings.seconds("BM_qcustomplot/65536")));
    return 0;
}
