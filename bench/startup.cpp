// Start-up to the main window shown, on the default simulated system: this program starts
// itself again a few times as a fresh process, each of which does what the panel's main does
// (the application, the main window's load handler with the splash and the module discovery,
// show, pending events run) and reports when the window is up. The figure is the median time
// from starting the process to that report, with the child's own split of it.
#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>

#include <QApplication>
#include <algorithm>
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>
#include <vector>

#include "bench_support.h"
#include "core/windows.h"
#include "display/MainFrm.h"

extern char** environ;

namespace {

using Clock = std::chrono::steady_clock;

constexpr int runs = 7;

double ms_since(Clock::time_point t) {
    return std::chrono::duration<double, std::milli>(Clock::now() - t).count();
}

// The child: prints "shown <ms from main to the window shown> <ms of the load handler>".
int child(int argc, char** argv) {
    const Clock::time_point start = Clock::now();
    QApplication app(argc, argv);
    QApplication::setApplicationName(QStringLiteral("Ostrana K7720A Soft Front Panel"));
    const Clock::time_point load = Clock::now();
    MainFrm& main_window = forms::get<MainFrm>();
    main_window.Form_Load();
    const double load_ms = ms_since(load);
    main_window.show();
    QApplication::processEvents();
    if (!main_window.isVisible())
        return 1;
    std::printf("shown %.3f %.3f\n", ms_since(start), load_ms);
    std::fflush(stdout);
    forms::destroy_all();
    return 0;
}

struct Run {
    double total_ms, main_ms, load_ms;
};

// One fresh process, timed from just before it is started to its report.
Run run_child(const char* self) {
    int out[2];
    if (pipe(out) != 0)
        bench::fail("no pipe");
    posix_spawn_file_actions_t actions;
    posix_spawn_file_actions_init(&actions);
    posix_spawn_file_actions_adddup2(&actions, out[1], STDOUT_FILENO);
    posix_spawn_file_actions_addclose(&actions, out[0]);
    char child_flag[] = "--child";
    char* args[] = {const_cast<char*>(self), child_flag, nullptr};
    const Clock::time_point start = Clock::now();
    pid_t pid = 0;
    if (posix_spawn(&pid, self, &actions, nullptr, args, environ) != 0)
        bench::fail("cannot start " + std::string(self));
    posix_spawn_file_actions_destroy(&actions);
    close(out[1]);
    std::string text;
    char buffer[256];
    double total = 0;
    for (ssize_t got; (got = read(out[0], buffer, sizeof buffer)) > 0;) {
        text.append(buffer, static_cast<size_t>(got));
        if (total == 0 && text.find('\n') != std::string::npos)
            total = ms_since(start);
    }
    close(out[0]);
    int status = 0;
    waitpid(pid, &status, 0);
    Run r{total, 0, 0};
    if (!WIFEXITED(status) || WEXITSTATUS(status) != 0 ||
        std::sscanf(text.c_str(), "shown %lf %lf", &r.main_ms, &r.load_ms) != 2)
        bench::fail("the panel did not start: " + text);
    return r;
}

double median(std::vector<double> v) {
    std::sort(v.begin(), v.end());
    return v[v.size() / 2];
}

}  // namespace

int main(int argc, char** argv) {
    bench::use_offscreen_platform();
    if (argc > 1 && std::strcmp(argv[1], "--child") == 0)
        return child(argc, argv);
    unsetenv("OST7720_SIM_MODULES");  // the default simulated system
    unsetenv("OST7720_SIM_FAIL");
    unsetenv("OST7720_SIM_TRACE");
    std::vector<double> total, main_part, load;
    run_child("/proc/self/exe");  // once to warm the file cache, not counted
    for (int i = 0; i < runs; ++i) {
        const Run r = run_child("/proc/self/exe");
        total.push_back(r.total_ms);
        main_part.push_back(r.main_ms);
        load.push_back(r.load_ms);
    }
    bench::print_figure("startup_ms", "process_start_to_shown_ms", median(total));
    bench::print_figure("startup_ms", "main_to_shown_ms", median(main_part));
    bench::print_figure("startup_ms", "form_load_ms", median(load));
    std::printf("startup_ms %.4g\n", median(total));
    return 0;
}
