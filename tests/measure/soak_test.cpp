// Soak: a long Repeat run on the virtual clock with four traces and four output files. Memory
// must stay flat from block 1000 to the end, every file must hold every block, and no file may
// be left open. 10000 blocks (2000 in the sanitizer build); K7720_SOAK_BLOCKS sets another
// count (1000 at least).
#include <malloc.h>

#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <set>

#include "run_fixture.h"

#if defined(__SANITIZE_ADDRESS__)
// From the sanitizer runtime (its header comes with clang only).
extern "C" size_t __sanitizer_get_current_allocated_bytes();
#endif

namespace {

#if defined(__SANITIZE_ADDRESS__)
// The sanitizer's allocator keeps freed blocks in quarantine (up to 256 MB): resident memory
// grows until it is full, so only the live heap tells a leak there. Each block costs several
// times more there; the long run is the default build's.
constexpr bool rss_is_meaningful = false;
constexpr long default_blocks = 2000;
long heap_kb() {
    return static_cast<long>(__sanitizer_get_current_allocated_bytes() / 1024);
}
#else
constexpr bool rss_is_meaningful = true;
constexpr long default_blocks = 10000;
long heap_kb() {
    return static_cast<long>(mallinfo2().uordblks / 1024);
}
#endif

constexpr int32_t points = 64;
// One 64-point block at the top span takes 64 / 51200 s.
constexpr double block_seconds = 64.0 / 51200.0;

long resident_kb() {
    std::ifstream statm("/proc/self/statm");
    long size = 0, resident = 0;
    statm >> size >> resident;
    return resident * (sysconf(_SC_PAGESIZE) / 1024);
}

// What each open descriptor refers to: files, pipes, sockets. Qt's event descriptors
// (anon_inode:[eventfd]) come and go with its own machinery and are left out.
std::multiset<std::string> open_descriptors() {
    std::multiset<std::string> out;
    for (const auto& entry : std::filesystem::directory_iterator("/proc/self/fd")) {
        std::error_code ec;
        const std::string target = std::filesystem::read_symlink(entry.path(), ec).string();
        if (target.rfind("anon_inode:", 0) != 0 && target.find("/proc/") == std::string::npos)
            out.insert(target);
    }
    return out;
}

// Lines that are not one quoted sample ended by CR LF.
size_t malformed_lines(const std::string& path) {
    std::ifstream in(path, std::ios::binary);
    size_t bad = 0;
    for (std::string line; std::getline(in, line);)
        bad += line.size() < 4 || line.front() != '"' || !line.ends_with("\"\r");
    return bad;
}

class SoakTest : public RunTest {};

TEST_F(SoakTest, RepeatRunKeepsMemoryFlatWritesEveryBlockAndLeavesNoFileOpen) {
    const char* env = std::getenv("K7720_SOAK_BLOCKS");
    const long blocks = env ? std::max(1000L, std::atol(env)) : default_blocks;
    main().Form_Load();
    sim::use_virtual_clock();
    global::blocksize = points;
    global::single_block = global::flag_false;
    for (int t = 0; t < 4; ++t) {
        global::trace_channel[t] = t + 1;
        global::trace_file[t] = file("trace" + std::to_string(t + 1) + ".txt");
    }
    const auto fds_before = open_descriptors();

    const auto started = std::chrono::steady_clock::now();
    click(main().GoBtn);
    ASSERT_EQ(global::num_points, points);
    long read = 0, ticks = 0, rss_1000 = 0, heap_1000 = 0;
    std::multiset<std::string> fds_1000;
    while (read < blocks && ticks++ < 2 * blocks) {
        // The simulator's call log is the test's record, not the panel's: keep it short.
        sim::clear_call_log();
        tick(block_seconds);
        read += calls_to("ost7720_readFloat64Data") > 0;
        if (read == 1000 && rss_1000 == 0) {
            rss_1000 = resident_kb();
            heap_1000 = heap_kb();
            fds_1000 = open_descriptors();
        }
    }
    ASSERT_EQ(read, blocks);
    const long rss_end = resident_kb(), heap_end = heap_kb();
    EXPECT_EQ(main().GoBtn->text(), "Stop");
    click(main().GoBtn);
    EXPECT_EQ(global::running, global::flag_false);
    const double seconds = std::chrono::duration<double>(std::chrono::steady_clock::now() - started).count();
    const auto fds_end = open_descriptors();
    std::printf(
        "[ soak ] %ld blocks of %d points in %.1f s; RSS %ld kB at block 1000, %ld kB at block %ld; "
        "heap %ld kB, %ld kB; open descriptors %zu before Go, %zu at block 1000, %zu at the end\n",
        blocks, points, seconds, rss_1000, rss_end, blocks, heap_1000, heap_end, fds_before.size(),
        fds_1000.size(), fds_end.size());
    // Flat: a leak of even a few hundred bytes a block would show as megabytes here.
    if (rss_is_meaningful) {
        EXPECT_LT(rss_end - rss_1000, 2048);
    }
    EXPECT_LT(heap_end - heap_1000, 512);
    // No trace file is left open, nor anything else: the same descriptors as before Go.
    EXPECT_EQ(fds_1000, fds_before);
    EXPECT_EQ(fds_end, fds_before);
    for (int t = 0; t < 4; ++t) {
        const std::string& path = global::trace_file[t];
        EXPECT_EQ(lines_in(path), static_cast<size_t>(blocks) * (points + 1)) << path;
        EXPECT_EQ(malformed_lines(path), 0u) << path;
    }
    EXPECT_TRUE(messages.empty());
}

}  // namespace
