// Hostile texts typed (key by key) and pasted into every text box and combo box of every page
// and into the main window's scale boxes, then OK or Apply: nothing crashes, every value that
// reaches the driver is one the page allows (a code it knows, a number within its limits, never
// NaN), a number too big for its integer is handled as the page decided and never wraps round
// to another channel or source, and a run still works afterwards.
#include <unistd.h>

#include <QApplication>
#include <QClipboard>
#include <QTest>
#include <algorithm>
#include <cfloat>
#include <cmath>
#include <cstdlib>
#include <filesystem>
#include <functional>
#include <set>
#include <string>
#include <vector>

#include "core/global.h"
#include "core/windows.h"
#include "display/MainFrm.h"
#include "ost7720.h"
#include "pages/DispFrm.h"
#include "pages/InputFrm.h"
#include "pages/MeasFrm.h"
#include "pages/SrcFrm.h"
#include "panel_fixture.h"

namespace {

namespace fs = std::filesystem;

// A line edit takes at most this many characters; a longer paste is cut there.
constexpr int max_line = 32767;

struct Hostile {
    const char* name;
    QString text;
    // The number at the start of the text as the pages read it, worked out by hand (beyond the
    // double range: the largest double), and whether it rounds to a 16- and a 32-bit integer.
    double number;
    bool fits16;
    bool fits32;
};

QString repeated(const QString& piece, int length) {
    QString s;
    while (s.size() < length)
        s += piece;
    return s.left(length);
}

const std::vector<Hostile>& hostile_texts() {
    static const std::vector<Hostile> texts = {
        {"empty", "", 0, true, true},
        {"blanks", "   ", 0, true, true},
        {"1e308", "1e308", 1e308, false, false},
        {"-1e308", "-1e308", -1e308, false, false},
        {"nan", "nan", 0, true, true},
        {"inf", "inf", 0, true, true},
        {"40000", "40000", 40000, false, true},
        {"1e10", "1e10", 1e10, false, false},
        {"&H10", "&H10", 0, true, true},
        {"1,5", "1,5", 1, true, true},
        // 2^16 + 2 and 2^32 + 2 wrap round to 2 in 16 and 32 bits: channel or source 2 exists.
        {"65538", "65538", 65538, false, true},
        {"4294967298", "4294967298", 4294967298.0, false, false},
        {"long digits", repeated("1234567890", 100000), DBL_MAX, false, false},
        {"long letters", repeated("abcdefghijklmnopqrstuvwxyz", 100000), 0, true, true},
        {"symbols", QString::fromUtf8("\u03a9\u00b2\u00b5"), 0, true, true},
        {"japanese", QString::fromUtf8("\u65e5\u672c\u8a9e"), 0, true, true},
    };
    return texts;
}

enum class Entry { typed, pasted };

const char* entry_name(Entry e) {
    return e == Entry::typed ? "typed" : "pasted";
}

// What a box holds after the text went in.
QString held(const QString& text) {
    return text.left(max_line);
}

// Empties a box the way a user does: select all, then Backspace.
void clear_box(QLineEdit* box) {
    QTest::keyClick(box, Qt::Key_A, Qt::ControlModifier);
    QTest::keyClick(box, Qt::Key_Backspace);
}

void enter(QLineEdit* box, const QString& text, Entry how) {
    clear_box(box);
    if (how == Entry::typed) {
        // One key press per character, with the character as its text (keyClicks would drop
        // anything beyond Latin-1).
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

void enter(QComboBox* box, const QString& text, Entry how) {
    enter(box->lineEdit(), text, how);
}

void click(QAbstractButton* b) {
    QTest::mouseClick(b, Qt::LeftButton);
}

double arg_number(const sim::Call& c, size_t i) {
    return std::strtod(c.args.at(i).c_str(), nullptr);
}

// Every set call in the log carries a value the pages allow: a known code, a number within the
// page's limits, never NaN.
void expect_allowed_values(const std::vector<sim::Call>& log, const std::string& context) {
    using Codes = std::set<long>;
    struct Limits {
        double low;
        double high;
    };
    static const std::vector<std::pair<std::string, Codes>> codes = {
        {"ost7720_setActive", {420, 421}},
        {"ost7720_setTriggerChannel", {420, 421}},
        {"ost7720_setSourceMode", {170, 171, 172, 173, 174, 175, 176, 177}},
        {"ost7720_setSourceOutput", {700, 701, 702, 703, 704}},
        {"ost7720_setSourceSum", {190, 191}},
        {"ost7720_setSourceCola", {180, 181}},
        {"ost7720_setCoupling", {100, 101}},
        {"ost7720_setAntiAliasDigital", {615, 616}},
        {"ost7720_setTriggerSlope", {410, 411}},
        {"ost7720_setInputMode", {130, 131, 132, 133, 134}},
        {"ost7720_setTriggerMode", {414, 415}},
    };
    static const std::vector<std::pair<std::string, Limits>> limits = {
        {"ost7720_setRange", {0, 20}},       {"ost7720_setRampRate", {0, 100}},
        {"ost7720_setSineFreq", {0, 25600}}, {"ost7720_setSinePhase", {-360, 360}},
        {"ost7720_setSourceSeed", {0, 255}}, {"ost7720_setDutyCycle", {0, 1}},
    };
    for (const sim::Call& c : log) {
        for (const auto& [name, allowed] : codes)
            if (c.name == name) {
                EXPECT_TRUE(allowed.count(std::atol(c.args.at(2).c_str()))) << context << ": " << c.line();
            }
        for (const auto& [name, lim] : limits) {
            if (c.name != name)
                continue;
            const double v = arg_number(c, 2);
            EXPECT_TRUE(v >= lim.low && v <= lim.high) << context << ": " << c.line();
        }
        if (c.name == "ost7720_setTriggerLevel") {
            EXPECT_TRUE(c.args.at(2) == "416" || c.args.at(2) == "417") << context << ": " << c.line();
            EXPECT_FALSE(std::isnan(arg_number(c, 3))) << context << ": " << c.line();
        }
        if (c.name == "ost7720_setBlocksize") {
            EXPECT_GT(arg_number(c, 2), 0) << context << ": " << c.line();
        }
        if (c.name == "ost7720_setSpan") {
            const double v = arg_number(c, 2);
            EXPECT_TRUE(v > 0 && v < 76801) << context << ": " << c.line();
        }
    }
}

// The calls named so, in log order.
std::vector<sim::Call> calls(const std::string& name) {
    std::vector<sim::Call> out;
    for (const sim::Call& c : sim::call_log())
        if (c.name == name)
            out.push_back(c);
    return out;
}

class HostileInputTest : public PanelTest {
  protected:
    void SetUp() override {
        PanelTest::SetUp();
        // Hostile file names are written where the panel runs: somewhere of our own.
        old_dir_ = fs::current_path();
        std::string pattern = (fs::temp_directory_path() / "k7720_hostile_XXXXXX").string();
        ASSERT_NE(mkdtemp(pattern.data()), nullptr);
        dir_ = pattern;
        fs::current_path(dir_);
        main().Form_Load();
        sim::use_virtual_clock();
    }
    void TearDown() override {
        fs::current_path(old_dir_);
        std::error_code ec;
        fs::remove_all(dir_, ec);
        PanelTest::TearDown();
    }

    MainFrm& main() { return forms::get<MainFrm>(); }

    // Every hostile text, typed and pasted (the long ones only pasted).
    void for_each_entry(const std::function<void(const Hostile&, Entry, const std::string&)>& body) {
        for (const Hostile& h : hostile_texts()) {
            for (Entry how : {Entry::typed, Entry::pasted}) {
                if (how == Entry::typed && h.text.size() > 100)
                    continue;
                body(h, how, std::string(h.name) + " " + entry_name(how));
            }
        }
    }

    // Go in Single Block, then a tick once the block is due: a block is read and the run ends.
    void expect_a_run_works(const std::string& context) {
        ASSERT_TRUE(main().isVisible()) << context;
        global::single_block = global::flag_true;
        sim::clear_call_log();
        click(main().GoBtn);
        ASSERT_EQ(global::running, global::flag_true) << context;
        // The accepted block size and span give the block's time: span × 2.56 samples a second.
        sim::advance_clock(global::blocksize / (2.56 * global::span) + 1);
        main().MainTimer_Timer();
        EXPECT_EQ(global::running, global::flag_false) << context;
        EXPECT_EQ(main().GoBtn->text(), "Go") << context;
        EXPECT_TRUE(main().GoBtn->isEnabled()) << context;
        EXPECT_GT(calls("ost7720_readFloat64Data").size(), 0u) << context;
        expect_allowed_values(sim::call_log(), context);
    }

    size_t notices(const std::string& text) const {
        return static_cast<size_t>(std::count_if(messages.begin(), messages.end(), [&](const Message& m) {
            return m.kind == dialogs::Kind::notice && m.text == text;
        }));
    }

    fs::path old_dir_;
    fs::path dir_;
};

// ---------------------------------------------------------------------------------------------
// Display Controls

TEST_F(HostileInputTest, DisplayPageStoresChannelsThatFitAndNamesAsTypedAndRunsGoOn) {
    for_each_entry([&](const Hostile& h, Entry how, const std::string& context) {
        const int32_t want_channel = h.fits32 ? static_cast<int32_t>(h.number) : 0;
        for (size_t i = 0; i < 4; ++i) {
            for (bool file_box : {false, true}) {
                DispFrm& page = forms::get<DispFrm>();
                page.trace_choice = {"1", "OFF", "OFF", "OFF", ""};
                global::trace_file.fill("");
                click(main().DispBtn);
                ASSERT_TRUE(page.isVisible());
                QLineEdit* box = file_box ? page.Text1[i] : page.TrcChanCmbo[i]->lineEdit();
                enter(box, h.text, how);
                ASSERT_EQ(box->text(), held(h.text)) << context;
                click(page.doneBtn);
                ASSERT_TRUE(main().isVisible()) << context;
                if (file_box) {
                    EXPECT_EQ(global::trace_file[i], held(h.text).toStdString()) << context;
                } else {
                    EXPECT_EQ(global::trace_channel[i], want_channel) << context << " trace " << i + 1;
                }
            }
        }

        // Every box at once, then a run: hostile file names are written or refused by name.
        DispFrm& page = forms::get<DispFrm>();
        click(main().DispBtn);
        for (size_t i = 0; i < 4; ++i) {
            enter(page.TrcChanCmbo[i], h.text, how);
            enter(page.Text1[i], h.text, how);
        }
        click(page.doneBtn);
        for (size_t i = 0; i < 4; ++i) {
            EXPECT_EQ(global::trace_channel[i], want_channel) << context;
        }
        messages.clear();
        expect_a_run_works(context);
        // One block: the names are all the same, so at most the one message.
        EXPECT_LE(messages.size(), 1u) << context;
        for (const Message& m : messages) {
            EXPECT_EQ(m.text.rfind("Couldn't create ", 0), 0u) << context;
        }
    });
}

// ---------------------------------------------------------------------------------------------
// Measurement Control

TEST_F(HostileInputTest, MeasPageTakesOnlyBlockSizesAndSpansItAllowsAndRunsGoOn) {
    for_each_entry([&](const Hostile& h, Entry how, const std::string& context) {
        const int32_t old_size = 1024;
        const double old_span = 20000.0;
        const int32_t want_size = h.fits32 && h.number >= 1 ? static_cast<int32_t>(h.number) : old_size;
        const double want_span = h.number > 0 && h.number < 76801 ? h.number : old_span;
        for (bool size_box : {true, false}) {
            global::blocksize = old_size;
            global::span = old_span;
            click(main().MeasBtn);
            MeasFrm& page = forms::get<MeasFrm>();
            ASSERT_TRUE(page.isVisible());
            QLineEdit* box = size_box ? page.BlocksizeTxt : page.SpanTxt;
            enter(box, h.text, how);
            ASSERT_EQ(box->text(), held(h.text)) << context;
            click(page.doneBtn);
            ASSERT_TRUE(main().isVisible()) << context;
            EXPECT_EQ(global::blocksize, size_box ? want_size : old_size) << context;
            EXPECT_EQ(global::span, size_box ? old_span : want_span) << context;
            expect_a_run_works(context + (size_box ? " block size" : " span"));
            const std::vector<sim::Call> size = calls("ost7720_setBlocksize");
            const std::vector<sim::Call> span = calls("ost7720_setSpan");
            ASSERT_EQ(size.size(), 1u) << context;
            ASSERT_EQ(span.size(), 1u) << context;
            EXPECT_EQ(arg_number(size[0], 2), size_box ? want_size : old_size) << context;
            EXPECT_EQ(arg_number(span[0], 2), size_box ? old_span : want_span) << context;
        }
    });
}

// ---------------------------------------------------------------------------------------------
// Input Setup

TEST_F(HostileInputTest, InputPageSendsAllowedValuesAndRefusesChannelsBeyond16Bits) {
    InputFrm& page = forms::get<InputFrm>();
    auto open = [&] {
        page.cur_chan = 1;
        click(main().InpBtn);
        EXPECT_TRUE(page.isVisible());
        if (page.AllSameChk->isChecked())
            click(page.AllSameChk);  // one channel at a time: the channel box takes text
        sim::clear_call_log();
        messages.clear();
    };

    for_each_entry([&](const Hostile& h, Entry how, const std::string& context) {
        const std::vector<QComboBox*> combos = {page.ChnNumCmbo,  page.CoupCmbo,   page.DAACmbo,
                                                page.inpmodeCmbo, page.TrigOnCmbo, page.TrigModeCmbo,
                                                page.TrigDirCmbo};
        const std::vector<QLineEdit*> texts = {page.RangeTxt, page.TrigLvlTxt, page.HystTxt};
        std::vector<QLineEdit*> boxes;
        for (QComboBox* c : combos)
            boxes.push_back(c->lineEdit());
        boxes.insert(boxes.end(), texts.begin(), texts.end());

        for (QLineEdit* box : boxes) {
            const std::string where =
                context + " in box " +
                std::to_string(std::find(boxes.begin(), boxes.end(), box) - boxes.begin());
            open();
            // The two fixed boxes take no text.
            ASSERT_FALSE(page.GndCmbo->isEnabled());
            ASSERT_FALSE(page.AAACmbo->isEnabled());
            const bool positive = page.TrigDirCmbo->currentText() == "Pos/Exit";
            enter(box, h.text, how);
            ASSERT_EQ(box->text(), held(h.text)) << where;
            sim::clear_call_log();
            click(page.doneBtn);
            const std::vector<sim::Call> log = sim::call_log();
            expect_allowed_values(log, where);

            if (box == page.ChnNumCmbo->lineEdit() && !h.fits16) {
                // Refused with its message; nothing sent; the page stays for a correction.
                EXPECT_TRUE(log.empty()) << where;
                ASSERT_EQ(messages.size(), 1u) << where;
                EXPECT_EQ(messages[0].text.rfind("Channel number ", 0), 0u) << where;
                EXPECT_EQ(page.cur_chan, 1) << where;
                EXPECT_TRUE(page.isVisible()) << where;
                click(page.cancelBtn);
                continue;
            }
            // Every set call goes to the one channel the box names: the number as it rounds, which
            // for a text without a number is channel 0 (the driver refuses it, the report says so).
            const int32_t target = box == page.ChnNumCmbo->lineEdit() ? static_cast<int32_t>(h.number) : 1;
            for (const sim::Call& c : log)
                if (c.name.rfind("ost7720_set", 0) == 0) {
                    EXPECT_EQ(c.args.at(1), std::to_string(target)) << where << ": " << c.line();
                }
            EXPECT_TRUE(main().isVisible()) << where;

            if (box == page.RangeTxt) {
                const std::vector<sim::Call> range = calls("ost7720_setRange");
                ASSERT_EQ(range.size(), 1u) << where;
                EXPECT_EQ(arg_number(range[0], 2), std::clamp(h.number, 0.0, 20.0)) << where;
            }
            if (box == page.TrigLvlTxt) {
                // The level typed is the one the slope fires at.
                const std::vector<sim::Call> levels = calls("ost7720_setTriggerLevel");
                ASSERT_EQ(levels.size(), 2u) << where;
                EXPECT_EQ(arg_number(levels[positive ? 1 : 0], 3), h.number) << where;
            }
            if (box == page.inpmodeCmbo->lineEdit()) {
                EXPECT_TRUE(calls("ost7720_setInputMode").empty()) << where;
            }
        }

        // Every box at once, sent to all inputs, then a run.
        click(main().InpBtn);
        if (!page.AllSameChk->isChecked())
            click(page.AllSameChk);
        EXPECT_FALSE(page.ChnNumCmbo->isEnabled());
        for (QLineEdit* box : boxes)
            if (box->isEnabled())
                enter(box, h.text, how);
        sim::clear_call_log();
        click(page.doneBtn);
        expect_allowed_values(sim::call_log(), context + " all boxes");
        for (const sim::Call& c : sim::call_log())
            if (c.name.rfind("ost7720_set", 0) == 0) {
                EXPECT_EQ(c.args.at(1), std::to_string(global::group_inputs)) << context << ": " << c.line();
            }
        expect_a_run_works(context + " all boxes");
    });
}

// ---------------------------------------------------------------------------------------------
// Source Setup

// What one source channel holds in the simulator.
std::vector<std::string> source_state(int32_t channel) {
    const int32_t s = global::session;
    int32_t active = 0, trigger = 0, mode = 0, output = 0, sum = 0, cola = 0, seed = 0;
    double ramp = 0, range = 0, freq = 0, phase = 0, duty = 0;
    ost7720_getActive(s, channel, &active);
    ost7720_getTriggerChannel(s, channel, &trigger);
    ost7720_getSourceMode(s, channel, &mode);
    ost7720_getSourceOutput(s, channel, &output);
    ost7720_getSourceSum(s, channel, &sum);
    ost7720_getSourceCola(s, channel, &cola);
    ost7720_getSourceSeed(s, channel, &seed);
    ost7720_getRampRate(s, channel, &ramp);
    ost7720_getRange(s, channel, &range);
    ost7720_getSineFreq(s, channel, &freq);
    ost7720_getSinePhase(s, channel, &phase);
    ost7720_getDutyCycle(s, channel, &duty);
    std::vector<std::string> out;
    for (double v : {double(active), double(trigger), double(mode), double(output), double(sum), double(cola),
                     double(seed), ramp, range, freq, phase, duty})
        out.push_back(std::to_string(v));
    return out;
}

TEST_F(HostileInputTest, SourcePageSendsAllowedValuesAndNeverWritesAnotherSource) {
    SrcFrm& page = forms::get<SrcFrm>();
    ASSERT_EQ(global::num_sources, 2);
    const int32_t source1 = global::source_ids[0];
    const int32_t source2 = global::source_ids[1];

    // The first setupsource of an Apply: the calls before the page is read back.
    auto first_pass = [] {
        std::vector<sim::Call> out;
        for (const sim::Call& c : sim::call_log()) {
            if (c.name == "ost7720_getTriggerChannel")
                break;
            out.push_back(c);
        }
        return out;
    };
    auto sent_in = [](const std::vector<sim::Call>& pass, const std::string& name) {
        std::vector<sim::Call> out;
        for (const sim::Call& c : pass)
            if (c.name == name)
                out.push_back(c);
        return out;
    };

    for_each_entry([&](const Hostile& h, Entry how, const std::string& context) {
        struct Box {
            QLineEdit* line;
            const char* bad_text_message;  // for a choice box: the notice a text it lacks gives
            const char* driver_call;       // for a number box: its call, limits, and the value sent
            double low;
            double high;
        };
        const std::vector<Box> boxes = {
            {page.SrcWhoCmbo->lineEdit(), nullptr, nullptr, 0, 0},
            {page.ActiveCmbo->lineEdit(), "bad active string", nullptr, 0, 0},
            {page.ModeCmbo->lineEdit(), "Unknown source mode ", nullptr, 0, 0},
            {page.OutputCmbo->lineEdit(), "Unknown source output ", nullptr, 0, 0},
            {page.SrcTrigCmbo->lineEdit(), "bad trig active string", nullptr, 0, 0},
            {page.ColaCmbo->lineEdit(), "bad cola string", nullptr, 0, 0},
            {page.SumCmbo->lineEdit(), "bad src sum string", nullptr, 0, 0},
            {page.RampRateTxt, nullptr, "ost7720_setRampRate", 0, 100},
            {page.FreqTxt, nullptr, "ost7720_setSineFreq", 0, 25600},
            {page.PhaseTxt, nullptr, "ost7720_setSinePhase", -360, 360},
            {page.SeedTxt, nullptr, "ost7720_setSourceSeed", 0, 255},
            {page.RangeTxt, nullptr, "ost7720_setRange", 0, 20},
            {page.DutyTxt, nullptr, "ost7720_setDutyCycle", 0, 1},
        };
        for (size_t b = 0; b < boxes.size(); ++b) {
            const Box& box = boxes[b];
            const std::string where = context + " in box " + std::to_string(b);
            page.cur_src = 1;
            click(main().SrcBtn);
            ASSERT_TRUE(page.isVisible());
            ASSERT_EQ(page.SrcWhoCmbo->currentText(), "1");
            const std::vector<std::string> before1 = source_state(source1);
            const std::vector<std::string> before2 = source_state(source2);
            enter(box.line, h.text, how);
            const QString shown = box.line->text();
            if (box.line != page.SrcWhoCmbo->lineEdit()) {
                ASSERT_EQ(box.line->text(), held(h.text)) << where;
            }
            sim::clear_call_log();
            messages.clear();
            // The keys went to the box without giving it the focus, so no focus change corrects
            // the source box before setupsource reads it.
            click(page.ApplyBtn);
            ASSERT_TRUE(page.isVisible()) << where;
            expect_allowed_values(sim::call_log(), where);
            const std::vector<sim::Call> pass = first_pass();

            if (box.line == page.SrcWhoCmbo->lineEdit()) {
                // Typing corrects the box key by key; a paste stands as it is. Either way only a
                // number that fits and names a source gets the page written, and only to it.
                const bool names_source = shown == held(h.text) ? h.fits16 && (h.number == 1 || h.number == 2)
                                                                : shown == "1" || shown == "2";
                if (!names_source) {
                    EXPECT_TRUE(sent_in(pass, "ost7720_setActive").empty()) << where;
                    EXPECT_TRUE(std::none_of(pass.begin(), pass.end(), [](const sim::Call& c) {
                        return c.name.rfind("ost7720_set", 0) == 0;
                    })) << where;
                }
                for (const sim::Call& c : sim::call_log())
                    if (c.name.rfind("ost7720_set", 0) == 0 && c.name != "ost7720_setActive") {
                        EXPECT_TRUE(c.args.at(1) == std::to_string(source1) ||
                                    c.args.at(1) == std::to_string(source2))
                            << where << ": " << c.line();
                    }
                if (!names_source) {
                    // At most the source shown is written again with what it holds.
                    EXPECT_EQ(source_state(source1), before1) << where;
                    EXPECT_EQ(source_state(source2), before2) << where;
                }
            } else {
                // Everything goes to source 1 (the one-active-source rule may switch source 2 off).
                for (const sim::Call& c : sim::call_log())
                    if (c.name.rfind("ost7720_set", 0) == 0 && c.name != "ost7720_setActive") {
                        EXPECT_EQ(c.args.at(1), std::to_string(source1)) << where << ": " << c.line();
                    }
                EXPECT_EQ(source_state(source2), before2) << where;
            }

            if (box.bad_text_message != nullptr) {
                // None of the hostile texts is a choice: the message, and the setting not sent
                // (the mode becomes Sine).
                const std::string msg = box.bad_text_message;
                const bool names_text = msg.back() == ' ';
                const std::string want = names_text ? msg + held(h.text).toStdString() + " - ignored" : msg;
                EXPECT_EQ(notices(want), 1u) << where;
                if (box.line == page.ModeCmbo->lineEdit()) {
                    const std::vector<sim::Call> mode = sent_in(pass, "ost7720_setSourceMode");
                    ASSERT_EQ(mode.size(), 1u) << where;
                    EXPECT_EQ(mode[0].args.at(2), "170") << where;
                }
                if (box.line == page.OutputCmbo->lineEdit()) {
                    EXPECT_TRUE(sent_in(pass, "ost7720_setSourceOutput").empty()) << where;
                }
                if (box.line == page.SrcTrigCmbo->lineEdit()) {
                    EXPECT_TRUE(sent_in(pass, "ost7720_setTriggerChannel").empty()) << where;
                }
                if (box.line == page.ColaCmbo->lineEdit()) {
                    EXPECT_TRUE(sent_in(pass, "ost7720_setSourceCola").empty()) << where;
                }
                if (box.line == page.SumCmbo->lineEdit()) {
                    EXPECT_TRUE(sent_in(pass, "ost7720_setSourceSum").empty()) << where;
                }
            }
            if (box.driver_call != nullptr) {
                const std::vector<sim::Call> sent = sent_in(pass, box.driver_call);
                ASSERT_EQ(sent.size(), 1u) << where;
                double want = std::clamp(h.number, box.low, box.high);
                if (std::string(box.driver_call) == "ost7720_setSourceSeed")
                    want = std::nearbyint(want);
                EXPECT_EQ(arg_number(sent[0], 2), want) << where;
            }
            click(page.cancelBtn);
        }

        // Every box at once (the source box too), Apply, OK, then a run.
        page.cur_src = 1;
        click(main().SrcBtn);
        for (const Box& box : boxes)
            enter(box.line, h.text, how);
        sim::clear_call_log();
        click(page.ApplyBtn);
        expect_allowed_values(sim::call_log(), context + " all boxes");
        click(page.doneBtn);
        expect_allowed_values(sim::call_log(), context + " all boxes");
        expect_a_run_works(context + " all boxes");
    });
}

// ---------------------------------------------------------------------------------------------
// Main window scale boxes

TEST_F(HostileInputTest, ScaleBoxesKeepFiniteLimitsAndTracesStillDraw) {
    global::trace_channel = {1, 2, 3, 4, 0};
    main().trace_update();
    for_each_entry([&](const Hostile& h, Entry how, const std::string& context) {
        // A number within the double range, with nothing else in the text, becomes the limit.
        const bool number = h.text == "1e308" || h.text == "-1e308" || h.text == "40000" ||
                            h.text == "1e10" || h.text == "65538" || h.text == "4294967298";
        for (int position = 0; position < 4; ++position) {
            for (bool high : {true, false}) {
                QLineEdit* box = high ? main().HighTxt[position] : main().LowTxt[position];
                std::array<double, 5>& limits = high ? global::trace_high : global::trace_low;
                const double before = limits[position];
                box->setEnabled(true);  // each redraw disables the boxes
                enter(box, h.text, how);
                const double after = limits[position];
                EXPECT_TRUE(std::isfinite(after)) << context;
                if (how == Entry::pasted) {
                    EXPECT_EQ(after, number ? h.number : before) << context << " position " << position;
                }
            }
        }
        expect_a_run_works(context);
        for (int position = 0; position < 4; ++position) {
            EXPECT_TRUE(std::isfinite(global::trace_high[position])) << context;
            EXPECT_TRUE(std::isfinite(global::trace_low[position])) << context;
        }
        global::trace_high.fill(1.0);
        global::trace_low.fill(-1.0);
    });
}

}  // namespace
