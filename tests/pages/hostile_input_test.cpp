// Hostile texts typed (key by key) and pasted into every text box and combo box of every page
// and into the main window's scale boxes, then OK or Apply: nothing crashes, every value that
// reaches the driver is one the page allows (a code it knows, a number within its limits, never
// NaN), a number too big for its integer is handled as the page decided and never wraps round
// to another channel or source, and a run still works afterwards.
#include <QApplication>
#include <QClipboard>
#include <QTemporaryDir>
#include <QTest>
#include <algorithm>
#include <cfloat>
#include <cmath>
#include <cstdlib>
#include <filesystem>
#include <functional>
#include <set>
#include <string>
#include <tuple>
#include <vector>

#include "core/global.h"
#include "core/windows.h"
#include "display/MainFrm.h"
#include "pages/DispFrm.h"
#include "pages/InputFrm.h"
#include "pages/MeasFrm.h"
#include "pages/SrcFrm.h"
#include "panel_fixture.h"

namespace {

namespace fs = std::filesystem;

// A text, and the number at its start as the pages read it, worked out by hand (beyond the double
// range: the largest double).
struct Hostile {
    QString text;
    double number;
    QString held() const { return text.left(32767); }  // what a box holds: a line edit keeps 32767 characters
    bool fits16() const { return std::abs(number) <= 32767; }
    bool fits32() const { return std::abs(number) <= 2147483647; }
};

// 2^16 + 2 and 2^32 + 2 wrap round to 2 in 16 and 32 bits: channel or source 2 exists.
// clang-format off
const std::vector<Hostile> hostile_texts = {
    {"", 0}, {"   ", 0}, {"1e308", 1e308}, {"-1e308", -1e308}, {"nan", 0}, {"inf", 0}, {"40000", 40000},
    {"1e10", 1e10}, {"&H10", 0}, {"1,5", 1}, {"65538", 65538}, {"4294967298", 4294967298.0},
    {QString("1234567890").repeated(10000), DBL_MAX}, {QString("abcdefghijklmnopqrstuvwxyz").repeated(4000), 0},
    {QString::fromUtf8("\u03a9\u00b2\u00b5"), 0}, {QString::fromUtf8("\u65e5\u672c\u8a9e"), 0}};
// clang-format on

// Empties the box as a user does (select all, Backspace), then types the text key by key (the
// character as the key's text: keyClicks drops anything beyond Latin-1) or pastes it.
void enter(QLineEdit* box, const QString& text, bool typed) {
    QTest::keyClick(box, Qt::Key_A, Qt::ControlModifier);
    QTest::keyClick(box, Qt::Key_Backspace);
    if (typed) {
        for (const QChar c : text)
            QTest::sendKeyEvent(QTest::Click, box, Qt::Key_unknown, QString(c), Qt::NoModifier);
        return;
    }
    QGuiApplication::clipboard()->setText(text);
    if (QGuiApplication::clipboard()->text() == text)
        QTest::keyClick(box, Qt::Key_V, Qt::ControlModifier);
    else
        box->insert(text);  // no clipboard on this platform: what a paste does
}

void click(QAbstractButton* b) {
    QTest::mouseClick(b, Qt::LeftButton);
}

// Argument arg of every call of the log named so, in log order.
std::vector<double> sent(const std::vector<sim::Call>& log, const std::string& name, size_t arg = 2) {
    std::vector<double> out;
    for (const sim::Call& c : log)
        if (c.name == name)
            out.push_back(std::strtod(c.args.at(arg).c_str(), nullptr));
    return out;
}

bool is_set(const sim::Call& c) {
    return c.name.rfind("ost7720_set", 0) == 0;
}

// Every set call of the log goes to one of these channels (setActive aside when asked: making
// one source active may switch another off).
void expect_sent_to(const std::vector<sim::Call>& log, const std::set<int32_t>& channels,
                    bool but_active = false) {
    for (const sim::Call& c : log)
        if (is_set(c) && !(but_active && c.name == "ost7720_setActive")) {
            EXPECT_TRUE(channels.count(std::atoi(c.args.at(1).c_str()))) << c.line();
        }
}

// Every set call in the log carries a value the pages allow: a known code (each call's codes are
// a run of whole numbers), a number within the page's limits, never NaN; the span is open at
// both ends.
void expect_allowed_values(const std::vector<sim::Call>& log) {
    // clang-format off
    static const std::vector<std::tuple<const char*, size_t, double, double>> rules = {
        {"ost7720_setActive", 2, 420, 421}, {"ost7720_setTriggerChannel", 2, 420, 421},
        {"ost7720_setSourceMode", 2, 170, 177}, {"ost7720_setSourceOutput", 2, 700, 704},
        {"ost7720_setSourceSum", 2, 190, 191}, {"ost7720_setSourceCola", 2, 180, 181},
        {"ost7720_setCoupling", 2, 100, 101}, {"ost7720_setAntiAliasDigital", 2, 615, 616},
        {"ost7720_setTriggerSlope", 2, 410, 411}, {"ost7720_setInputMode", 2, 130, 134},
        {"ost7720_setTriggerMode", 2, 414, 415}, {"ost7720_setTriggerLevel", 2, 416, 417},
        {"ost7720_setTriggerLevel", 3, -HUGE_VAL, HUGE_VAL}, {"ost7720_setRange", 2, 0, 20},
        {"ost7720_setRampRate", 2, 0, 100}, {"ost7720_setSineFreq", 2, 0, 25600},
        {"ost7720_setSinePhase", 2, -360, 360}, {"ost7720_setSourceSeed", 2, 0, 255},
        {"ost7720_setDutyCycle", 2, 0, 1}, {"ost7720_setBlocksize", 2, 1, 2147483647},
        {"ost7720_setSpan", 2, std::nextafter(0.0, 1.0), std::nextafter(76801.0, 0.0)}};
    // clang-format on
    for (const auto& [call, arg, low, high] : rules)
        for (double v : sent(log, call, arg)) {
            EXPECT_TRUE(v >= low && v <= high) << call << " argument " << arg << ": " << v;
        }
}

class HostileInputTest : public PanelTest {
  protected:
    void SetUp() override {
        PanelTest::SetUp();
        // Hostile file names are written where the panel runs: somewhere of our own.
        ASSERT_TRUE(dir_.isValid());
        fs::current_path(dir_.path().toStdString());
        main().Form_Load();
        sim::use_virtual_clock();
    }
    void TearDown() override {
        fs::current_path(old_dir_);
        PanelTest::TearDown();
    }

    MainFrm& main() { return forms::get<MainFrm>(); }

    // Every hostile text, typed and pasted (the long ones only pasted).
    void for_each_entry(const std::function<void(const Hostile&, bool typed)>& body) {
        for (const Hostile& h : hostile_texts)
            for (bool typed : {true, false})
                if (!typed || h.text.size() <= 100) {
                    SCOPED_TRACE(("\"" + (h.text.size() > 100 ? h.text.left(10) + "..." : h.text) + "\"")
                                     .toStdString() +
                                 (typed ? " typed" : " pasted"));
                    body(h, typed);
                }
    }

    // Clears the call log and messages, clicks, and checks the values that reached the driver.
    std::vector<sim::Call> press(QAbstractButton* button) {
        sim::clear_call_log();
        click(button);
        expect_allowed_values(sim::call_log());
        return sim::call_log();
    }

    // Go in Single Block, then a tick once the block is due: a block is read and the run ends.
    void expect_a_run_works() {
        ASSERT_TRUE(main().isVisible());
        global::single_block = global::flag_true;
        press(main().GoBtn);
        ASSERT_EQ(global::running, global::flag_true);
        // The accepted block size and span give the block's time: span × 2.56 samples a second.
        sim::advance_clock(global::blocksize / (2.56 * global::span) + 1);
        main().MainTimer_Timer();
        EXPECT_EQ(global::running, global::flag_false);
        EXPECT_EQ(main().GoBtn->text(), "Go");
        EXPECT_TRUE(main().GoBtn->isEnabled());
        EXPECT_FALSE(sent(sim::call_log(), "ost7720_readFloat64Data").empty());
        expect_allowed_values(sim::call_log());
    }

    fs::path old_dir_ = fs::current_path();
    QTemporaryDir dir_;
};

TEST_F(HostileInputTest, DisplayPageStoresChannelsThatFitAndNamesAsTypedAndRunsGoOn) {
    DispFrm& page = forms::get<DispFrm>();
    for_each_entry([&](const Hostile& h, bool typed) {
        click(main().DispBtn);
        ASSERT_TRUE(page.isVisible());
        for (size_t i = 0; i < 4; ++i)
            for (QLineEdit* box : {page.TrcChanCmbo[i]->lineEdit(), page.Text1[i]}) {
                enter(box, h.text, typed);
                ASSERT_EQ(box->text(), h.held());
            }
        click(page.doneBtn);
        for (size_t i = 0; i < 4; ++i) {
            EXPECT_EQ(global::trace_channel[i], h.fits32() ? static_cast<int32_t>(h.number) : 0)
                << "trace " << i;
            EXPECT_EQ(global::trace_file[i], h.held().toStdString()) << "trace " << i;
        }
        // Hostile file names are written or refused by name; all four are the same, so one block
        // gives at most the one message.
        messages.clear();
        expect_a_run_works();
        ASSERT_LE(messages.size(), 1u);
        EXPECT_TRUE(messages.empty() || messages[0].text.rfind("Couldn't create ", 0) == 0)
            << messages[0].text;
    });
}

TEST_F(HostileInputTest, MeasPageTakesOnlyBlockSizesAndSpansItAllowsAndRunsGoOn) {
    MeasFrm& page = forms::get<MeasFrm>();
    for_each_entry([&](const Hostile& h, bool typed) {
        // A value the page refuses leaves the old one: block size 1024, span 20000.
        const double size = h.fits32() && h.number >= 1 ? std::trunc(h.number) : 1024;
        const double span = h.number > 0 && h.number < 76801 ? h.number : 20000;
        for (bool size_box : {true, false}) {
            SCOPED_TRACE(size_box ? "block size" : "span");
            global::blocksize = 1024;
            global::span = 20000;
            click(main().MeasBtn);
            ASSERT_TRUE(page.isVisible());
            QLineEdit* box = size_box ? page.BlocksizeTxt : page.SpanTxt;
            enter(box, h.text, typed);
            ASSERT_EQ(box->text(), h.held());
            click(page.doneBtn);
            expect_a_run_works();
            EXPECT_EQ(sent(sim::call_log(), "ost7720_setBlocksize"),
                      std::vector<double>{size_box ? size : 1024});
            EXPECT_EQ(sent(sim::call_log(), "ost7720_setSpan"), std::vector<double>{size_box ? 20000 : span});
        }
    });
}

TEST_F(HostileInputTest, InputPageSendsAllowedValuesAndRefusesChannelsBeyond16Bits) {
    InputFrm& page = forms::get<InputFrm>();
    QLineEdit* const channel_box = page.ChnNumCmbo->lineEdit();
    std::vector<QLineEdit*> boxes = {page.RangeTxt, page.TrigLvlTxt, page.HystTxt};
    for (QComboBox* c : {page.ChnNumCmbo, page.CoupCmbo, page.DAACmbo, page.inpmodeCmbo, page.TrigOnCmbo,
                         page.TrigModeCmbo, page.TrigDirCmbo})
        boxes.push_back(c->lineEdit());
    for_each_entry([&](const Hostile& h, bool typed) {
        for (QLineEdit* box : boxes) {
            SCOPED_TRACE("box " + std::to_string(std::find(boxes.begin(), boxes.end(), box) - boxes.begin()));
            // One channel at a time, channel 1: the channel box takes text; the two fixed boxes none.
            page.cur_chan = 1;
            click(main().InpBtn);
            ASSERT_TRUE(page.isVisible());
            if (page.AllSameChk->isChecked())
                click(page.AllSameChk);
            ASSERT_FALSE(page.GndCmbo->isEnabled() || page.AAACmbo->isEnabled());
            const bool positive = page.TrigDirCmbo->currentText() == "Pos/Exit";
            messages.clear();
            enter(box, h.text, typed);
            ASSERT_EQ(box->text(), h.held());
            const std::vector<sim::Call> log = press(page.doneBtn);
            if (box == channel_box && !h.fits16()) {
                // Refused with its message; nothing sent; the page stays for a correction.
                EXPECT_TRUE(log.empty());
                ASSERT_EQ(messages.size(), 1u);
                EXPECT_EQ(messages[0].text.rfind("Channel number ", 0), 0u);
                EXPECT_EQ(page.cur_chan, 1);
                EXPECT_TRUE(page.isVisible());
                click(page.cancelBtn);
                continue;
            }
            // Every set call goes to the one channel the box names: the number as it rounds, which
            // for a text without a number is channel 0 (the driver refuses it, the report says so).
            expect_sent_to(log, {box == channel_box ? static_cast<int32_t>(h.number) : 1});
            EXPECT_TRUE(main().isVisible());
            if (box == page.RangeTxt) {
                EXPECT_EQ(sent(log, "ost7720_setRange"),
                          std::vector<double>(1, std::clamp(h.number, 0.0, 20.0)));
            }
            if (box == page.TrigLvlTxt) {
                // The level typed is the one the slope fires at.
                const std::vector<double> levels = sent(log, "ost7720_setTriggerLevel", 3);
                ASSERT_EQ(levels.size(), 2u);
                EXPECT_EQ(levels[positive ? 1 : 0], h.number);
            }
            if (box == page.inpmodeCmbo->lineEdit()) {
                EXPECT_TRUE(sent(log, "ost7720_setInputMode").empty());
            }
        }

        // Every box at once, sent to all inputs, then a run.
        SCOPED_TRACE("all boxes");
        click(main().InpBtn);
        if (!page.AllSameChk->isChecked())
            click(page.AllSameChk);
        EXPECT_FALSE(channel_box->isEnabled());
        for (QLineEdit* box : boxes)
            if (box->isEnabled())
                enter(box, h.text, typed);
        expect_sent_to(press(page.doneBtn), {global::group_inputs});
        expect_a_run_works();
    });
}

// Everything one source channel holds in the simulator.
auto source_state(int32_t channel) {
    sim::SourceView v;
    EXPECT_TRUE(sim::read_source(global::session, channel, v));
    return std::make_tuple(v.active, v.trigger, v.mode, v.output, v.sum, v.cola, v.range, v.ramp_rate,
                           v.sine_freq, v.sine_phase, v.seed, v.duty_cycle, v.amp_scale, v.blocksize,
                           v.buffer_size, v.buffer_mode, v.buffer_init, v.table);
}

TEST_F(HostileInputTest, SourcePageSendsAllowedValuesAndNeverWritesAnotherSource) {
    SrcFrm& page = forms::get<SrcFrm>();
    ASSERT_EQ(global::num_sources, 2);
    const int32_t source1 = global::source_ids[0];
    const int32_t source2 = global::source_ids[1];
    QLineEdit* const source_box = page.SrcWhoCmbo->lineEdit();
    struct Box {
        QLineEdit* line;
        const char* notice;  // a choice box: the notice for a text it lacks (one ending in a blank names it)
        const char* call;    // its setting's call; for a number box, with the limits of the value sent
        double low, high;
    };
    // clang-format off
    const std::vector<Box> boxes = {
        {source_box, nullptr, nullptr, 0, 0},
        {page.ActiveCmbo->lineEdit(), "bad active string", nullptr, 0, 0},
        {page.ModeCmbo->lineEdit(), "Unknown source mode ", "ost7720_setSourceMode", 0, 0},
        {page.OutputCmbo->lineEdit(), "Unknown source output ", "ost7720_setSourceOutput", 0, 0},
        {page.SrcTrigCmbo->lineEdit(), "bad trig active string", "ost7720_setTriggerChannel", 0, 0},
        {page.ColaCmbo->lineEdit(), "bad cola string", "ost7720_setSourceCola", 0, 0},
        {page.SumCmbo->lineEdit(), "bad src sum string", "ost7720_setSourceSum", 0, 0},
        {page.RampRateTxt, nullptr, "ost7720_setRampRate", 0, 100},
        {page.FreqTxt, nullptr, "ost7720_setSineFreq", 0, 25600},
        {page.PhaseTxt, nullptr, "ost7720_setSinePhase", -360, 360},
        {page.SeedTxt, nullptr, "ost7720_setSourceSeed", 0, 255},
        {page.RangeTxt, nullptr, "ost7720_setRange", 0, 20},
        {page.DutyTxt, nullptr, "ost7720_setDutyCycle", 0, 1}};
    // clang-format on

    for_each_entry([&](const Hostile& h, bool typed) {
        for (const Box& box : boxes) {
            SCOPED_TRACE("box " + std::to_string(&box - boxes.data()));
            page.cur_src = 1;
            click(main().SrcBtn);
            ASSERT_TRUE(page.isVisible());
            ASSERT_EQ(page.SrcWhoCmbo->currentText(), "1");
            const auto before1 = source_state(source1);
            const auto before2 = source_state(source2);
            enter(box.line, h.text, typed);
            const QString shown = box.line->text();
            if (box.line != source_box) {
                ASSERT_EQ(shown, h.held());
            }
            messages.clear();
            // The keys went to the box without giving it the focus, so no focus change corrects
            // the source box before the page reads it.
            const std::vector<sim::Call> log = press(page.ApplyBtn);
            ASSERT_TRUE(page.isVisible());
            // The first pass of an Apply: the calls before the page is read back.
            const std::vector<sim::Call> pass(log.begin(),
                                              std::find_if(log.begin(), log.end(), [](const sim::Call& c) {
                                                  return c.name == "ost7720_getTriggerChannel";
                                              }));
            if (box.line == source_box) {
                // Typing corrects the box key by key; a paste stands as it is. Either way only a
                // number that fits and names a source gets the page written, and only to it.
                const bool names_source = shown == h.held() ? h.fits16() && (h.number == 1 || h.number == 2)
                                                            : shown == "1" || shown == "2";
                expect_sent_to(log, {source1, source2}, true);
                if (!names_source) {
                    EXPECT_TRUE(std::none_of(pass.begin(), pass.end(), is_set));
                    // At most the source shown is written again with what it holds.
                    EXPECT_EQ(source_state(source1), before1);
                    EXPECT_EQ(source_state(source2), before2);
                }
            } else {
                // Everything goes to source 1 (the one-active-source rule may switch source 2 off).
                expect_sent_to(log, {source1}, true);
                EXPECT_EQ(source_state(source2), before2);
            }

            if (box.notice != nullptr) {
                // None of the hostile texts is a choice: the notice, once, and the setting not
                // sent (the mode becomes Sine, 170).
                std::string want = box.notice;
                if (want.back() == ' ')
                    want += h.held().toStdString() + " - ignored";
                EXPECT_EQ(std::count_if(messages.begin(), messages.end(),
                                        [&](const Message& m) {
                                            return m.kind == dialogs::Kind::notice && m.text == want;
                                        }),
                          1);
                if (box.call != nullptr) {
                    const bool mode = box.line == page.ModeCmbo->lineEdit();
                    EXPECT_EQ(sent(pass, box.call), mode ? std::vector<double>{170} : std::vector<double>{});
                }
            } else if (box.call != nullptr) {
                const double want = std::clamp(h.number, box.low, box.high);
                EXPECT_EQ(sent(pass, box.call),
                          std::vector<double>{box.line == page.SeedTxt ? std::nearbyint(want) : want});
            }
            click(page.cancelBtn);
        }

        // Every box at once (the source box too), Apply, OK, then a run.
        SCOPED_TRACE("all boxes");
        page.cur_src = 1;
        click(main().SrcBtn);
        for (const Box& box : boxes)
            enter(box.line, h.text, typed);
        press(page.ApplyBtn);
        press(page.doneBtn);
        expect_a_run_works();
    });
}

TEST_F(HostileInputTest, ScaleBoxesKeepFiniteLimitsAndTracesStillDraw) {
    global::trace_channel = {1, 2, 3, 4, 0};
    main().trace_update();
    for_each_entry([&](const Hostile& h, bool typed) {
        // A number within the double range, with nothing else in the text, becomes the limit.
        const bool number = h.text == "1e308" || h.text == "-1e308" || h.text == "40000" ||
                            h.text == "1e10" || h.text == "65538" || h.text == "4294967298";
        for (size_t position = 0; position < 4; ++position)
            for (bool high : {true, false}) {
                QLineEdit* box = high ? main().HighTxt[position] : main().LowTxt[position];
                const double& limit = (high ? global::trace_high : global::trace_low)[position];
                const double before = limit;
                box->setEnabled(true);  // each redraw disables the boxes
                enter(box, h.text, typed);
                EXPECT_TRUE(std::isfinite(limit));
                if (!typed) {
                    EXPECT_EQ(limit, number ? h.number : before) << "position " << position;
                }
            }
        expect_a_run_works();
        for (size_t position = 0; position < 4; ++position) {
            EXPECT_TRUE(std::isfinite(global::trace_high[position]) &&
                        std::isfinite(global::trace_low[position]));
        }
        global::trace_high.fill(1.0);
        global::trace_low.fill(-1.0);
    });
}

}  // namespace
