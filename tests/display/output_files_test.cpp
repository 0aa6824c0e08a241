// The output files: exact bytes per block, rewrite and append, which traces are written, and
// every failure (missing folder, folder name, read-only file, full disk, disk full part way)
// giving the one message while the files written before stay intact.
#include "display/output_files.h"

#include <fcntl.h>
#include <linux/fs.h>
#include <sys/ioctl.h>
#include <sys/resource.h>
#include <unistd.h>

#include <cmath>
#include <csignal>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>
#include <vector>

#include "core/global.h"
#include "core/number_text.h"
#include "panel_fixture.h"

namespace fs = std::filesystem;

namespace {

const std::string message_tail = ".  No output file was created";

// The block of the hand-worked example: samples 1.5, -2, 0, 1E-20, and element 4 left at 0.
const std::string example_block = "\" 1.5\"\r\n\"-2\"\r\n\" 0\"\r\n\" 1E-20\"\r\n\" 0\"\r\n";

class OutputFilesTest : public PanelTest {
  protected:
    void SetUp() override {
        PanelTest::SetUp();
        std::string pattern = (fs::temp_directory_path() / "k7720_output_XXXXXX").string();
        ASSERT_NE(mkdtemp(pattern.data()), nullptr);
        dir = pattern;
        for (int t = 0; t <= 3; ++t)
            global::trace_data(t).assign(1, 0.0);
    }
    void TearDown() override {
        std::error_code ec;
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

    void write(int16_t append) { write_trace_files(append); }

    static std::string contents(const std::string& file) {
        std::ifstream in(file, std::ios::binary);
        return std::string(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
    }

    void expect_one_message_for(const std::string& file) {
        ASSERT_EQ(messages.size(), 1u);
        EXPECT_EQ(messages[0].kind, dialogs::Kind::notice);
        EXPECT_EQ(messages[0].text, "Couldn't create " + file + message_tail);
    }

    fs::path dir;
};

TEST_F(OutputFilesTest, BlockIsWrittenAsQuotedStandardTextWithCrLf) {
    global::num_points = 4;
    set_trace(0, {1.5, -2.0, 0.0, 1E-20}, path("t1.txt"));
    set_trace(2, {0.25, -0.5, 123456789012345.0, 1E15}, path("t3.txt"));
    write(global::flag_false);
    EXPECT_EQ(contents(path("t1.txt")), example_block);
    EXPECT_EQ(contents(path("t3.txt")),
              "\" .25\"\r\n\"-.5\"\r\n\" 123456789012345\"\r\n\" 1E+15\"\r\n\" 0\"\r\n");
    EXPECT_TRUE(messages.empty());
}

TEST_F(OutputFilesTest, SingleBlockRewritesAndRepeatAppendsOneBlockPerCall) {
    global::num_points = 4;
    const std::string file = path("trace.txt");
    { std::ofstream(file) << "old contents of an earlier run\n"; }
    set_trace(0, {1.5, -2.0, 0.0, 1E-20}, file);
    write(global::flag_false);
    write(global::flag_false);
    EXPECT_EQ(contents(file), example_block);
    write(global::flag_true);
    write(global::flag_true);
    EXPECT_EQ(contents(file), example_block + example_block + example_block);

    // Appending creates a missing file.
    set_trace(1, {7.0, 8.0, 9.0, 10.0}, path("new.txt"));
    write(global::flag_true);
    EXPECT_EQ(contents(path("new.txt")), "\" 7\"\r\n\" 8\"\r\n\" 9\"\r\n\" 10\"\r\n\" 0\"\r\n");
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
    // Slot 4 exists in the per-trace arrays but is never a trace.
    global::trace_channel[4] = 1;
    global::trace_file[4] = path("slot4.txt");
    write(global::flag_false);
    EXPECT_FALSE(fs::exists(path("channel0.txt")));
    EXPECT_FALSE(fs::exists(path("negative.txt")));
    EXPECT_FALSE(fs::exists(path("slot4.txt")));
    EXPECT_EQ(contents(path("shown.txt")), "\" 4\"\r\n\" 0\"\r\n");
    EXPECT_EQ(std::distance(fs::directory_iterator(dir), fs::directory_iterator()), 1);
    EXPECT_TRUE(messages.empty());
}

TEST_F(OutputFilesTest, TwoTracesOnOneFileKeepTheLaterInSingleModeAndBothInRepeat) {
    global::num_points = 2;
    const std::string file = path("shared.txt");
    set_trace(0, {1.0, 2.0}, file);
    set_trace(3, {-3.0, -4.0}, file);
    write(global::flag_false);
    const std::string later = "\"-3\"\r\n\"-4\"\r\n\" 0\"\r\n";
    EXPECT_EQ(contents(file), later);
    write(global::flag_true);
    EXPECT_EQ(contents(file), later + "\" 1\"\r\n\" 2\"\r\n\" 0\"\r\n" + later);
}

TEST_F(OutputFilesTest, MissingFolderShowsTheMessageOnceAndSkipsTheLaterTraces) {
    global::num_points = 4;
    const std::string missing = path("no such folder/trace.txt");
    set_trace(0, {1.5, -2.0, 0.0, 1E-20}, path("first.txt"));
    set_trace(1, {1.0, 1.0, 1.0, 1.0}, missing);
    set_trace(2, {2.0, 2.0, 2.0, 2.0}, path("third.txt"));
    set_trace(3, {3.0, 3.0, 3.0, 3.0}, path("fourth.txt"));
    write(global::flag_false);
    expect_one_message_for(missing);
    EXPECT_EQ(contents(path("first.txt")), example_block);
    EXPECT_FALSE(fs::exists(path("third.txt")));
    EXPECT_FALSE(fs::exists(path("fourth.txt")));

    // In repeat mode each block gives its own message, and an existing later file keeps its
    // earlier blocks without the new one.
    { std::ofstream(path("third.txt")) << "earlier"; }
    messages.clear();
    write(global::flag_true);
    write(global::flag_true);
    ASSERT_EQ(messages.size(), 2u);
    EXPECT_EQ(messages[1].text, "Couldn't create " + missing + message_tail);
    EXPECT_EQ(contents(path("first.txt")), example_block + example_block + example_block);
    EXPECT_EQ(contents(path("third.txt")), "earlier");
}

TEST_F(OutputFilesTest, FolderNameFailsInBothModes) {
    global::num_points = 1;
    fs::create_directory(path("folder"));
    set_trace(1, {5.0}, path("folder"));
    write(global::flag_false);
    expect_one_message_for(path("folder"));
    messages.clear();
    write(global::flag_true);
    expect_one_message_for(path("folder"));
    EXPECT_TRUE(fs::is_directory(path("folder")));
}

// Makes a file read-only in a way that also holds for root (the immutable attribute), or with
// the permission bits when that attribute is not available. Undone on destruction.
class ReadOnly {
  public:
    explicit ReadOnly(const std::string& file) : file_(file) {
        fs::permissions(file, fs::perms::owner_read | fs::perms::group_read | fs::perms::others_read);
        const int fd = ::open(file.c_str(), O_RDONLY);
        int flags = 0;
        if (fd >= 0 && ::ioctl(fd, FS_IOC_GETFLAGS, &flags) == 0) {
            flags |= FS_IMMUTABLE_FL;
            immutable_ = ::ioctl(fd, FS_IOC_SETFLAGS, &flags) == 0;
        }
        if (fd >= 0)
            ::close(fd);
    }
    ~ReadOnly() {
        if (immutable_) {
            int fd = ::open(file_.c_str(), O_RDONLY);
            int flags = 0;
            if (fd >= 0 && ::ioctl(fd, FS_IOC_GETFLAGS, &flags) == 0) {
                flags &= ~FS_IMMUTABLE_FL;
                ::ioctl(fd, FS_IOC_SETFLAGS, &flags);
            }
            if (fd >= 0)
                ::close(fd);
        }
    }
    // Whether writing is really refused (root ignores the permission bits).
    bool holds() const { return ::access(file_.c_str(), W_OK) != 0 || immutable_; }

  private:
    std::string file_;
    bool immutable_ = false;
};

TEST_F(OutputFilesTest, ReadOnlyFileFailsAndKeepsItsContents) {
    global::num_points = 1;
    const std::string file = path("readonly.txt");
    { std::ofstream(file) << "kept"; }
    ReadOnly read_only(file);
    if (!read_only.holds())
        GTEST_SKIP() << "this user can write read-only files";
    set_trace(0, {1.0}, path("before.txt"));
    set_trace(1, {2.0}, file);
    set_trace(2, {3.0}, path("after.txt"));
    write(global::flag_false);
    expect_one_message_for(file);
    messages.clear();
    write(global::flag_true);
    expect_one_message_for(file);
    EXPECT_EQ(contents(file), "kept");
    EXPECT_EQ(contents(path("before.txt")), "\" 1\"\r\n\" 0\"\r\n\" 1\"\r\n\" 0\"\r\n");
    EXPECT_FALSE(fs::exists(path("after.txt")));
}

TEST_F(OutputFilesTest, FullDiskFailsAndLaterTracesAreNotWritten) {
    if (!fs::exists("/dev/full"))
        GTEST_SKIP() << "no /dev/full";
    global::num_points = 4;
    set_trace(0, {1.5, -2.0, 0.0, 1E-20}, path("first.txt"));
    set_trace(1, {1.0, 1.0, 1.0, 1.0}, "/dev/full");
    set_trace(2, {2.0, 2.0, 2.0, 2.0}, path("third.txt"));
    write(global::flag_false);
    expect_one_message_for("/dev/full");
    messages.clear();
    write(global::flag_true);
    expect_one_message_for("/dev/full");
    EXPECT_EQ(contents(path("first.txt")), example_block + example_block);
    EXPECT_FALSE(fs::exists(path("third.txt")));
}

// Lets files grow only to `limit` bytes for its lifetime (writes beyond fail as on a full disk).
class FileSizeLimit {
  public:
    explicit FileSizeLimit(rlim_t limit) {
        old_handler_ = std::signal(SIGXFSZ, SIG_IGN);
        getrlimit(RLIMIT_FSIZE, &old_);
        rlimit lowered = old_;
        lowered.rlim_cur = limit;
        set_ = setrlimit(RLIMIT_FSIZE, &lowered) == 0;
    }
    ~FileSizeLimit() {
        setrlimit(RLIMIT_FSIZE, &old_);
        std::signal(SIGXFSZ, old_handler_);
    }
    bool set() const { return set_; }

  private:
    rlimit old_{};
    void (*old_handler_)(int) = nullptr;
    bool set_ = false;
};

TEST_F(OutputFilesTest, DiskFullPartWayCutsTheFileBackToItsEarlierBlocks) {
    global::num_points = 4;
    const std::string file = path("grows.txt");
    set_trace(0, {1.5, -2.0, 0.0, 1E-20}, file);
    write(global::flag_true);
    write(global::flag_true);
    const std::string two_blocks = example_block + example_block;
    ASSERT_EQ(contents(file), two_blocks);

    // The next block fits only in part: the file must not keep that part.
    {
        FileSizeLimit limit(two_blocks.size() + 10);
        ASSERT_TRUE(limit.set());
        write(global::flag_true);
    }
    expect_one_message_for(file);
    EXPECT_EQ(contents(file), two_blocks);

    // A rewrite that fails part way leaves no partial block either.
    messages.clear();
    {
        FileSizeLimit limit(10);
        ASSERT_TRUE(limit.set());
        write(global::flag_false);
    }
    expect_one_message_for(file);
    EXPECT_EQ(fs::file_size(file), 0u);
}

std::vector<std::string> split_crlf_lines(const std::string& text) {
    std::vector<std::string> lines;
    size_t from = 0;
    for (size_t crlf; (crlf = text.find("\r\n", from)) != std::string::npos; from = crlf + 2)
        lines.push_back(text.substr(from, crlf - from));
    EXPECT_EQ(from, text.size()) << "text after the last CR LF";
    return lines;
}

TEST_F(OutputFilesTest, BlocksAboveThe16BitRangeWriteEveryLine) {
    global::num_points = 65536;
    std::vector<double> samples(65536);
    for (size_t k = 0; k < samples.size(); ++k)
        samples[k] = (static_cast<double>(k) - 30000.0) / 1024.0;
    set_trace(0, samples, path("big.txt"));
    write(global::flag_false);
    EXPECT_TRUE(messages.empty());

    const std::vector<std::string> lines = split_crlf_lines(contents(path("big.txt")));
    ASSERT_EQ(lines.size(), 65537u);
    EXPECT_EQ(lines[0], "\"-29.296875\"");
    EXPECT_EQ(lines[30000], "\" 0\"");
    EXPECT_EQ(lines[30001], "\" .0009765625\"");
    EXPECT_EQ(lines[30103], "\" .1005859375\"");
    EXPECT_EQ(lines[32768], "\" 2.703125\"");
    EXPECT_EQ(lines[65535], "\" 34.7021484375\"");
    EXPECT_EQ(lines[65536], "\" 0\"");
    for (size_t k = 0; k < 65536; ++k)
        ASSERT_EQ(numtext::val(std::string_view(lines[k]).substr(1)), samples[k]) << "line " << k;

    // Larger still, in repeat mode, from an array that ends part way: every line in order, the
    // missing samples as 0.
    global::num_points = 140000;
    std::vector<double> counting(100000);
    for (size_t k = 0; k < counting.size(); ++k)
        counting[k] = static_cast<double>(k);
    global::trace_data(0) = counting;
    write(global::flag_true);
    const std::vector<std::string> both = split_crlf_lines(contents(path("big.txt")));
    ASSERT_EQ(both.size(), 65537u + 140001u);
    for (size_t k = 0; k <= 140000; ++k) {
        const std::string want = k < 100000 ? "\" " + std::to_string(k) + "\"" : "\" 0\"";
        ASSERT_EQ(both[65537 + k], want) << "line " << k;
    }
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
    const std::vector<std::string> lines = split_crlf_lines(contents(path("kinds.txt")));
    ASSERT_EQ(lines.size(), samples.size() + 1);
    for (size_t k = 0; k < samples.size(); ++k)
        ASSERT_EQ(lines[k], "\"" + numtext::str(samples[k]) + "\"") << "line " << k;
    EXPECT_EQ(lines[7], "\"-2\"");
    EXPECT_EQ(lines[63], "\"NaN\"");
    EXPECT_EQ(lines[77], "\"-Inf\"");
    EXPECT_TRUE(messages.empty());
}

TEST_F(OutputFilesTest, ArrayShorterThanTheBlockWritesZerosForTheMissingSamples) {
    global::num_points = 5;
    set_trace(0, {}, path("short.txt"));
    global::trace_data(0) = {1.0, 2.0};
    write(global::flag_false);
    EXPECT_EQ(contents(path("short.txt")), "\" 1\"\r\n\" 2\"\r\n\" 0\"\r\n\" 0\"\r\n\" 0\"\r\n\" 0\"\r\n");
    global::trace_data(0).clear();
    write(global::flag_false);
    EXPECT_EQ(contents(path("short.txt")), "\" 0\"\r\n\" 0\"\r\n\" 0\"\r\n\" 0\"\r\n\" 0\"\r\n\" 0\"\r\n");
}

}  // namespace
