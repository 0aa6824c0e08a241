// The output files: exact bytes per block, rewrite and append, which traces are written, blocks
// of any size; and, in a real run (files named on the Display page, Go, blocks on the virtual
// clock), every kind of failure giving its one message per block while the run goes on, the
// files written before it stay whole and no file keeps part of a block.
#include "display/output_files.h"

#include <fcntl.h>
#include <linux/fs.h>
#include <sys/ioctl.h>
#include <sys/resource.h>
#include <unistd.h>

#include <QTest>
#include <algorithm>
#include <cmath>
#include <csignal>
#include <filesystem>
#include <fstream>
#include <iterator>

#include "core/number_text.h"
#include "display_test.h"
#include "pages/DispFrm.h"
#include "pages/MeasFrm.h"

namespace fs = std::filesystem;

namespace {

// The block of the hand-worked example: samples 1.5, -2, 0, 1E-20, and element 4 left at 0.
const std::string example_block = "\" 1.5\"\r\n\"-2\"\r\n\" 0\"\r\n\" 1E-20\"\r\n\" 0\"\r\n";

std::string contents(const std::string& file) {
    std::ifstream in(file, std::ios::binary);
    return std::string(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
}

std::vector<std::string> crlf_lines(const std::string& text) {
    std::vector<std::string> lines;
    size_t from = 0;
    for (size_t crlf; (crlf = text.find("\r\n", from)) != std::string::npos; from = crlf + 2)
        lines.push_back(text.substr(from, crlf - from));
    EXPECT_EQ(from, text.size()) << "text after the last CR LF";
    return lines;
}

// The number of whole 1024-point blocks in a trace file, or -1 when it holds anything else:
// 1025 lines of quoted numbers a block, the last of each the quoted 0 after the samples.
long whole_blocks(const std::string& file) {
    const std::vector<std::string> lines = crlf_lines(contents(file));
    for (size_t k = 0; k < lines.size(); ++k) {
        const std::string& line = lines[k];
        if (line.size() < 3 || line.front() != '"' || line.back() != '"' ||
            (k % 1025 == 1024 && line != "\" 0\""))
            return -1;
    }
    return lines.size() % 1025 == 0 ? static_cast<long>(lines.size() / 1025) : -1;
}

// Sets or clears the immutable attribute, which stops writes by root as well.
bool set_immutable(const std::string& file, bool on) {
    const int fd = ::open(file.c_str(), O_RDONLY);
    int flags = 0;
    bool ok = fd >= 0 && ::ioctl(fd, FS_IOC_GETFLAGS, &flags) == 0;
    flags = on ? (flags | FS_IMMUTABLE_FL) : (flags & ~FS_IMMUTABLE_FL);
    ok = ok && ::ioctl(fd, FS_IOC_SETFLAGS, &flags) == 0;
    if (fd >= 0)
        ::close(fd);
    return ok;
}

// Lets files grow only to `limit` bytes while it lives: a write beyond fails as on a full disk
// (with SIGXFSZ ignored, as an error instead of the end of the process).
struct FileSizeLimit {
    rlimit old{};
    bool set = false;
    explicit FileSizeLimit(rlim_t limit) {
        std::signal(SIGXFSZ, SIG_IGN);
        getrlimit(RLIMIT_FSIZE, &old);
        const rlimit lowered{limit, old.rlim_max};
        set = setrlimit(RLIMIT_FSIZE, &lowered) == 0;
    }
    ~FileSizeLimit() { setrlimit(RLIMIT_FSIZE, &old); }
};

class OutputFilesTest : public PanelTest {
  protected:
    void SetUp() override {
        PanelTest::SetUp();
        std::string pattern = (fs::temp_directory_path() / "k7720_output_XXXXXX").string();
        ASSERT_NE(mkdtemp(pattern.data()), nullptr);
        dir = pattern;
    }
    void TearDown() override {
        std::error_code ec;
        if (!read_only.empty()) {
            set_immutable(read_only, false);
            fs::permissions(read_only, fs::perms::owner_all, ec);
        }
        fs::remove_all(dir, ec);
        PanelTest::TearDown();
    }

    std::string path(const std::string& name) const { return (dir / name).string(); }

    // Shows trace t on input 1 with these samples (element num_points added as 0) and a file.
    void set_trace(int t, std::vector<double> samples, const std::string& file) {
        samples.push_back(0.0);
        global::trace_data(t) = samples;
        global::trace_channel[t] = 1;
        global::trace_file[t] = file;
    }
    static void write(int16_t append) { write_trace_files(append); }

    size_t messages_for(const std::string& file) const {
        const std::string want = "Couldn't create " + file + ".  No output file was created";
        return static_cast<size_t>(std::count_if(messages.begin(), messages.end(), [&](const Message& m) {
            return m.kind == dialogs::Kind::notice && m.text == want;
        }));
    }

    fs::path dir;
    std::string read_only;  // a file made read-only, made writable again at the end
};

TEST_F(OutputFilesTest, BlocksAreQuotedStandardTextsWithCrLfRewrittenOrAppended) {
    global::num_points = 4;
    const std::string file = path("trace.txt");
    std::ofstream(file) << "old contents of an earlier run\n";
    set_trace(0, {1.5, -2.0, 0.0, 1E-20}, file);
    set_trace(2, {0.25, -0.5, 123456789012345.0, 1E15}, path("t3.txt"));
    write(global::flag_false);
    write(global::flag_false);
    EXPECT_EQ(contents(file), example_block);
    EXPECT_EQ(contents(path("t3.txt")),
              "\" .25\"\r\n\"-.5\"\r\n\" 123456789012345\"\r\n\" 1E+15\"\r\n\" 0\"\r\n");
    write(global::flag_true);
    write(global::flag_true);
    EXPECT_EQ(contents(file), example_block + example_block + example_block);

    // Appending creates a missing file; a file named twice holds the later trace after a
    // rewrite and both in order after an append.
    const std::string later = "\" 7\"\r\n\" 8\"\r\n\" 9\"\r\n\" 10\"\r\n\" 0\"\r\n";
    set_trace(3, {7.0, 8.0, 9.0, 10.0}, path("new.txt"));
    write(global::flag_true);
    EXPECT_EQ(contents(path("new.txt")), later);
    global::trace_file[3] = file;
    write(global::flag_false);
    EXPECT_EQ(contents(file), later);
    write(global::flag_true);
    EXPECT_EQ(contents(file), later + example_block + later);
    EXPECT_TRUE(messages.empty());
}

TEST_F(OutputFilesTest, OnlyShownTracesWithAFileNameAreWritten) {
    global::num_points = 1;
    set_trace(0, {1.0}, "");
    set_trace(1, {2.0}, path("channel0.txt"));
    global::trace_channel[1] = 0;
    set_trace(2, {3.0}, path("negative.txt"));
    global::trace_channel[2] = -1;
    set_trace(3, {4.0}, path("shown.txt"));
    global::trace_channel[4] = 1;  // slot 4 exists in the per-trace arrays but is never a trace
    global::trace_file[4] = path("slot4.txt");
    write(global::flag_false);
    EXPECT_EQ(contents(path("shown.txt")), "\" 4\"\r\n\" 0\"\r\n");
    EXPECT_EQ(std::distance(fs::directory_iterator(dir), fs::directory_iterator()), 1);
    EXPECT_TRUE(messages.empty());
}

TEST_F(OutputFilesTest, BlocksOfAnySizeWriteEveryLine) {
    // 65536 points: beyond a 16-bit counter, 65537 lines.
    global::num_points = 65536;
    std::vector<double> samples(65536);
    for (size_t k = 0; k < samples.size(); ++k)
        samples[k] = (static_cast<double>(k) - 30000.0) / 1024.0;
    set_trace(0, samples, path("big.txt"));
    write(global::flag_false);
    const std::vector<std::string> lines = crlf_lines(contents(path("big.txt")));
    ASSERT_EQ(lines.size(), 65537u);
    EXPECT_EQ(lines[0], "\"-29.296875\"");
    EXPECT_EQ(lines[30000], "\" 0\"");
    EXPECT_EQ(lines[30001], "\" .0009765625\"");
    EXPECT_EQ(lines[65535], "\" 34.7021484375\"");
    EXPECT_EQ(lines[65536], "\" 0\"");
    for (size_t k = 0; k < 65536; ++k)
        ASSERT_EQ(numtext::val(std::string_view(lines[k]).substr(1)), samples[k]) << "line " << k;

    // Larger still, in repeat mode, from an array that ends part way: every line in order, the
    // missing samples as 0; and an empty array gives zeros only.
    global::num_points = 140000;
    global::trace_data(0).resize(100000);
    for (size_t k = 0; k < 100000; ++k)
        global::trace_data(0)[k] = static_cast<double>(k);
    write(global::flag_true);
    const std::vector<std::string> both = crlf_lines(contents(path("big.txt")));
    ASSERT_EQ(both.size(), 65537u + 140001u);
    for (size_t k = 0; k <= 140000; ++k)
        ASSERT_EQ(both[65537 + k], k < 100000 ? "\" " + std::to_string(k) + "\"" : "\" 0\"") << "line " << k;
    global::num_points = 2;
    global::trace_data(0).clear();
    write(global::flag_false);
    EXPECT_EQ(contents(path("big.txt")), "\" 0\"\r\n\" 0\"\r\n\" 0\"\r\n");
    EXPECT_TRUE(messages.empty());
}

TEST_F(OutputFilesTest, EveryKindOfNumberAnywhereInABlockIsItsStandardText) {
    // The block is formatted many numbers at a time; numbers of every form, and those that take
    // a slower way (zero, infinities, NaN, subnormals), at every place within those batches.
    const std::vector<double> kinds = {1.5,  -2.0,    0.0,   -0.0,     1E-20,     0.00012, -.25,
                                       1E15, 1E-300,  NAN,   INFINITY, -INFINITY, 5E-324,  123456789012345.0,
                                       -7.1, 2.0 / 3, 1E-05, 99.5};
    std::vector<double> samples;
    for (int k = 0; k < 1000; ++k)
        samples.push_back(k % 7 == 0 ? kinds[static_cast<size_t>(k / 7) % kinds.size()] : std::sin(k) * 8.0);
    global::num_points = static_cast<int32_t>(samples.size());
    set_trace(0, samples, path("kinds.txt"));
    write(global::flag_false);
    const std::vector<std::string> lines = crlf_lines(contents(path("kinds.txt")));
    ASSERT_EQ(lines.size(), samples.size() + 1);
    for (size_t k = 0; k < samples.size(); ++k)
        ASSERT_EQ(lines[k], "\"" + numtext::str(samples[k]) + "\"") << "line " << k;
    EXPECT_EQ(lines[7], "\"-2\"");
    EXPECT_EQ(lines[63], "\"NaN\"");
    EXPECT_EQ(lines[77], "\"-Inf\"");
}

TEST_F(OutputFilesTest, RewriteThatFailsPartWayLeavesNoPartialBlock) {
    global::num_points = 4;
    set_trace(0, {1.5, -2.0, 0.0, 1E-20}, path("t.txt"));
    {
        FileSizeLimit limit(10);
        ASSERT_TRUE(limit.set);
        write(global::flag_false);
    }
    EXPECT_EQ(messages_for(path("t.txt")), 1u);
    EXPECT_EQ(fs::file_size(path("t.txt")), 0u);
}

// A run with 1024-point blocks at the top span, one block per 1024 / 51200 s.
class OutputRunTest : public OutputFilesTest {
  protected:
    void SetUp() override {
        OutputFilesTest::SetUp();
        main().Form_Load();
        sim::use_virtual_clock();
    }
    MainFrm& main() { return forms::get<MainFrm>(); }
    static void click(QAbstractButton* b) { QTest::mouseClick(b, Qt::LeftButton); }

    // Through the Display page: trace i shows input i + 1 and writes to files[i] ("" = none).
    void name_files(const std::vector<std::string>& files) {
        click(main().DispBtn);
        DispFrm& page = forms::get<DispFrm>();
        for (size_t i = 0; i < 4; ++i) {
            page.TrcChanCmbo[i]->setEditText(QString::number(i + 1));
            page.Text1[i]->clear();
            QTest::keyClicks(page.Text1[i], QString::fromStdString(i < files.size() ? files[i] : ""));
        }
        click(page.doneBtn);
        ASSERT_TRUE(main().isVisible());
    }
    void choose_repeat(bool repeat) {
        click(main().MeasBtn);
        MeasFrm& page = forms::get<MeasFrm>();
        click(repeat ? page.RepeatBtn : page.SingleBtn);
        click(page.doneBtn);
    }
    void next_block() {
        sim::advance_clock(1024.0 / 51200.0);
        main().MainTimer_Timer();
    }
    bool run_goes_on() {
        return global::running == global::flag_true && main().MainTimer->isActive() &&
               main().GoBtn->text() == "Stop" && main().GoBtn->isEnabled();
    }
};

class EachFailure : public OutputRunTest, public testing::WithParamInterface<std::string> {
  protected:
    // A name that fails to be written, or "" where this machine cannot make one.
    std::string failing_name() {
        if (GetParam() == "MissingFolder") {
            fs::remove_all(path("gone"));
            return path("gone/trace.txt");
        }
        if (GetParam() == "FolderName") {
            fs::remove(path("folder"));
            fs::create_directory(path("folder"));
            return path("folder");
        }
        if (GetParam() == "ReadOnlyFile") {
            // The immutable attribute holds for root too; the permission bits do for others.
            read_only = path("read-only.txt");
            std::ofstream(read_only) << "kept";
            fs::permissions(read_only, fs::perms::owner_read);
            return set_immutable(read_only, true) || ::access(read_only.c_str(), W_OK) != 0 ? read_only : "";
        }
        return fs::exists("/dev/full") ? "/dev/full" : "";
    }
};

TEST_P(EachFailure, OneMessagePerBlockTheRunGoesOnAndTheEarlierFileStaysWhole) {
    const std::string bad = failing_name();
    if (bad.empty())
        GTEST_SKIP() << GetParam() << ": cannot be set up on this machine";
    const std::string before = path("before.txt"), after = path("after.txt");
    std::ofstream(after) << "earlier run";
    name_files({before, bad, after});
    choose_repeat(true);
    messages.clear();

    click(main().GoBtn);
    for (int block = 1; block <= 3; ++block) {
        SCOPED_TRACE(block);
        next_block();
        EXPECT_EQ(messages_for(bad), static_cast<size_t>(block));
        EXPECT_TRUE(run_goes_on());
        EXPECT_EQ(whole_blocks(before), block);
        EXPECT_EQ(contents(after), "earlier run");  // the traces after the failure are skipped
    }
    EXPECT_EQ(messages.size(), 3u);
    if (bad == read_only) {
        EXPECT_EQ(contents(bad), "kept");
    }

    // Stop, then Single Block: Go works again, the one message, and the run ends as usual.
    click(main().GoBtn);
    choose_repeat(false);
    messages.clear();
    click(main().GoBtn);
    next_block();
    EXPECT_EQ(messages.size(), 1u);
    EXPECT_EQ(messages_for(bad), 1u);
    EXPECT_EQ(global::running, global::flag_false);
    EXPECT_EQ(main().GoBtn->text(), "Go");
    EXPECT_EQ(global::trace_has_data[0], global::flag_true);
    EXPECT_EQ(whole_blocks(before), 1);
    EXPECT_EQ(contents(after), "earlier run");
}

INSTANTIATE_TEST_SUITE_P(OutputFiles, EachFailure,
                         testing::Values("MissingFolder", "FolderName", "ReadOnlyFile", "FullDisk"),
                         [](const testing::TestParamInfo<std::string>& info) { return info.param; });

TEST_F(OutputRunTest, DiskFullPartWayThroughAnAppendKeepsOnlyWholeBlocks) {
    const std::string early = path("early.txt"), first = path("first.txt"), third = path("third.txt");
    std::string block;  // trace 2's file holds three blocks from an earlier run
    for (int k = 0; k < 1024; ++k)
        block += "\" 1\"\r\n";
    const std::string three_blocks = block + "\" 0\"\r\n" + block + "\" 0\"\r\n" + block + "\" 0\"\r\n";
    std::ofstream(early) << three_blocks;
    name_files({first, early, third});
    choose_repeat(true);
    // The next block fits the new, short file of trace 1 but only part of the next one.
    click(main().GoBtn);
    {
        FileSizeLimit limit(three_blocks.size() + 5000);
        ASSERT_TRUE(limit.set);
        next_block();
    }
    EXPECT_EQ(messages_for(early), 1u);
    EXPECT_EQ(messages.size(), 1u);
    EXPECT_EQ(contents(early), three_blocks);
    EXPECT_EQ(whole_blocks(first), 1);
    EXPECT_FALSE(fs::exists(third));
    EXPECT_TRUE(run_goes_on());

    // Room again: every file gets the next block whole.
    next_block();
    EXPECT_EQ(messages.size(), 1u);
    EXPECT_EQ(whole_blocks(first), 2);
    EXPECT_EQ(whole_blocks(early), 4);
    EXPECT_EQ(contents(early).substr(0, three_blocks.size()), three_blocks);
    EXPECT_EQ(whole_blocks(third), 1);

    click(main().GoBtn);
}

}  // namespace
