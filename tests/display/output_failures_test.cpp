// Output-file failures in a real run: the files named on the Display page, Repeat chosen on the
// Meas page, Go, and blocks arriving on the simulator's virtual clock. Every kind of failure must
// give its one message per block, leave the run going, keep the files written before it whole,
// and never leave a file holding part of a block.
#include <fcntl.h>
#include <linux/fs.h>
#include <sys/ioctl.h>
#include <sys/resource.h>
#include <unistd.h>

#include <QTest>
#include <algorithm>
#include <csignal>
#include <filesystem>
#include <fstream>
#include <functional>
#include <iterator>
#include <string>
#include <vector>

#include "core/global.h"
#include "core/windows.h"
#include "display/MainFrm.h"
#include "pages/DispFrm.h"
#include "pages/MeasFrm.h"
#include "panel_fixture.h"

namespace {

namespace fs = std::filesystem;

// One 1024-point block at the top span takes 1024 / 51200 s.
constexpr double block_seconds = 1024.0 / 51200.0;
constexpr size_t lines_per_block = 1025;

std::string contents(const std::string& file) {
    std::ifstream in(file, std::ios::binary);
    return std::string(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
}

// The number of whole blocks in a trace file, or -1 when it holds anything else: every line a
// quoted number ended by CR LF, 1025 lines a block, the last line of each block the quoted 0
// that stands for the element after the samples.
long whole_blocks(const std::string& file) {
    const std::string text = contents(file);
    size_t lines = 0;
    size_t from = 0;
    for (size_t crlf; (crlf = text.find("\r\n", from)) != std::string::npos; from = crlf + 2) {
        const std::string line = text.substr(from, crlf - from);
        if (line.size() < 3 || line.front() != '"' || line.back() != '"')
            return -1;
        ++lines;
        if (lines % lines_per_block == 0 && line != "\" 0\"")
            return -1;
    }
    if (from != text.size() || lines % lines_per_block != 0)
        return -1;
    return static_cast<long>(lines / lines_per_block);
}

// Sets or clears the immutable attribute, which stops writes by root as well.
bool set_immutable(const std::string& file, bool on) {
    const int fd = ::open(file.c_str(), O_RDONLY);
    if (fd < 0)
        return false;
    int flags = 0;
    bool ok = ::ioctl(fd, FS_IOC_GETFLAGS, &flags) == 0;
    if (ok) {
        flags = on ? (flags | FS_IMMUTABLE_FL) : (flags & ~FS_IMMUTABLE_FL);
        ok = ::ioctl(fd, FS_IOC_SETFLAGS, &flags) == 0;
    }
    ::close(fd);
    return ok;
}

// Lets files grow only to `limit` bytes while it lives: a write beyond fails as on a full disk.
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

class OutputFailuresTest : public PanelTest {
  protected:
    void SetUp() override {
        PanelTest::SetUp();
        std::string pattern = (fs::temp_directory_path() / "k7720_failures_XXXXXX").string();
        ASSERT_NE(mkdtemp(pattern.data()), nullptr);
        dir_ = pattern;
        main().Form_Load();
        sim::use_virtual_clock();
    }
    void TearDown() override {
        for (const std::string& f : immutable_)
            set_immutable(f, false);
        std::error_code ec;
        fs::remove_all(dir_, ec);
        PanelTest::TearDown();
    }

  public:
    std::string path(const std::string& name) const { return (dir_ / name).string(); }
    bool make_immutable(const std::string& file) {
        if (!set_immutable(file, true))
            return false;
        immutable_.push_back(file);
        return true;
    }

  protected:
    MainFrm& main() { return forms::get<MainFrm>(); }
    static void click(QAbstractButton* b) { QTest::mouseClick(b, Qt::LeftButton); }
    static void type(QLineEdit* box, const std::string& text) {
        box->clear();
        QTest::keyClicks(box, QString::fromStdString(text));
    }

    // Through the Display page: trace i shows input i + 1 and writes to files[i] ("" = none).
    void name_files(const std::vector<std::string>& files) {
        click(main().DispBtn);
        DispFrm& page = forms::get<DispFrm>();
        for (size_t i = 0; i < 4; ++i) {
            page.TrcChanCmbo[i]->setEditText(QString::number(i + 1));
            type(page.Text1[i], i < files.size() ? files[i] : "");
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

    // One timer tick after a block's time.
    void next_block() {
        sim::advance_clock(block_seconds);
        main().MainTimer_Timer();
    }

    bool run_goes_on() {
        return global::running == global::flag_true && main().MainTimer->isActive() &&
               main().GoBtn->text() == "Stop" && main().GoBtn->isEnabled();
    }

    size_t messages_for(const std::string& file) const {
        const std::string want = "Couldn't create " + file + ".  No output file was created";
        return static_cast<size_t>(std::count_if(messages.begin(), messages.end(), [&](const Message& m) {
            return m.kind == dialogs::Kind::notice && m.text == want;
        }));
    }

    fs::path dir_;
    std::vector<std::string> immutable_;
};

// One kind of failure: a set-up that makes a name fail (again after a repair), and a repair
// after which the same name can be written (none for the full disk).
struct Failure {
    const char* kind;
    std::function<std::string(OutputFailuresTest&)> make;
    std::function<void(const std::string&)> repair;
};

class EachFailure : public OutputFailuresTest, public testing::WithParamInterface<int> {
  protected:
    Failure failure();
};

Failure EachFailure::failure() {
    switch (GetParam()) {
        case 0:
            return {"missing folder",
                    [](OutputFailuresTest& t) {
                        fs::remove_all(t.path("no such folder"));
                        return t.path("no such folder/trace.txt");
                    },
                    [](const std::string& f) { fs::create_directory(fs::path(f).parent_path()); }};
        case 1:
            return {"folder name",
                    [](OutputFailuresTest& t) {
                        fs::remove(t.path("a folder"));
                        fs::create_directory(t.path("a folder"));
                        return t.path("a folder");
                    },
                    [](const std::string& f) { fs::remove(f); }};
        case 2:
            return {"read-only file",
                    [](OutputFailuresTest& t) {
                        const std::string f = t.path("read-only.txt");
                        std::ofstream(f) << "kept";
                        return t.make_immutable(f) ? f : std::string();
                    },
                    [](const std::string& f) {
                        set_immutable(f, false);
                        fs::remove(f);
                    }};
        default:
            return {"full disk",
                    [](OutputFailuresTest&) { return fs::exists("/dev/full") ? "/dev/full" : ""; }, nullptr};
    }
}

TEST_P(EachFailure, RepeatRunGivesOneMessagePerBlockGoesOnAndKeepsTheEarlierFile) {
    const Failure f = failure();
    const std::string bad = f.make(*this);
    if (bad.empty())
        GTEST_SKIP() << f.kind << ": cannot be set up on this machine";
    const std::string before = path("before.txt");
    const std::string after = path("after.txt");
    { std::ofstream(after) << "earlier run"; }
    name_files({before, bad, after});
    choose_repeat(true);
    messages.clear();

    click(main().GoBtn);
    for (int block = 1; block <= 3; ++block) {
        next_block();
        EXPECT_EQ(messages_for(bad), static_cast<size_t>(block)) << f.kind;
        EXPECT_TRUE(run_goes_on()) << f.kind;
        EXPECT_EQ(whole_blocks(before), block) << f.kind;
        EXPECT_EQ(contents(after), "earlier run") << f.kind;
    }
    EXPECT_EQ(messages.size(), 3u) << f.kind;
    if (bad == path("read-only.txt")) {
        EXPECT_EQ(contents(bad), "kept");
    }

    // Once the cause is gone, the next block reaches every file, with no message.
    if (f.repair) {
        f.repair(bad);
        next_block();
        EXPECT_EQ(messages.size(), 3u) << f.kind;
        EXPECT_EQ(whole_blocks(before), 4) << f.kind;
        EXPECT_EQ(whole_blocks(bad), 1) << f.kind;
        EXPECT_EQ(contents(after).substr(0, 11), "earlier run") << f.kind;
        EXPECT_TRUE(run_goes_on()) << f.kind;
        f.make(*this);  // fails again for the single block below
    }

    // Single Block: the one message, the run ends as usual, and Go works again.
    click(main().GoBtn);
    choose_repeat(false);
    for (size_t go = 1; go <= 2; ++go) {
        messages.clear();
        click(main().GoBtn);
        next_block();
        EXPECT_EQ(messages.size(), 1u) << f.kind;
        EXPECT_EQ(messages_for(bad), 1u) << f.kind;
        EXPECT_EQ(global::running, global::flag_false) << f.kind;
        EXPECT_EQ(main().GoBtn->text(), "Go") << f.kind;
        EXPECT_EQ(whole_blocks(before), 1) << f.kind;
        EXPECT_EQ(global::trace_has_data[0], global::flag_true) << f.kind;
    }
}

std::string failure_name(const testing::TestParamInfo<int>& info) {
    static const char* const names[] = {"MissingFolder", "FolderName", "ReadOnlyFile", "FullDisk"};
    return names[info.param];
}

INSTANTIATE_TEST_SUITE_P(OutputFiles, EachFailure, testing::Range(0, 4), failure_name);

TEST_F(OutputFailuresTest, DiskFullPartWayThroughAnAppendKeepsOnlyWholeBlocks) {
    const std::string early = path("early.txt");  // a trace file with three blocks already
    const std::string first = path("first.txt");
    const std::string third = path("third.txt");
    name_files({"", early});
    choose_repeat(true);
    click(main().GoBtn);
    for (int block = 0; block < 3; ++block)
        next_block();
    click(main().GoBtn);
    ASSERT_EQ(whole_blocks(early), 3);
    const std::string three_blocks = contents(early);

    // The next block fits the new, short file of trace 1 but only part of the next one.
    name_files({first, early, third});
    click(main().GoBtn);
    {
        FileSizeLimit limit(three_blocks.size() + 5000);
        ASSERT_TRUE(limit.set());
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

    // A limit that stops the first file part way stops the block there.
    const std::string two_blocks = contents(first);
    {
        FileSizeLimit limit(two_blocks.size() + 100);
        ASSERT_TRUE(limit.set());
        next_block();
    }
    EXPECT_EQ(messages_for(first), 1u);
    EXPECT_EQ(contents(first), two_blocks);
    EXPECT_EQ(whole_blocks(early), 4);
    EXPECT_EQ(whole_blocks(third), 1);
    EXPECT_TRUE(run_goes_on());
    click(main().GoBtn);
}

}  // namespace
