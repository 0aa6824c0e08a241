#include "pages/InputFrm.h"

#include <QCompleter>
#include <QStyle>
#include <QStyleOptionComboBox>
#include <algorithm>
#include <initializer_list>
#include <optional>
#include <string>

#include "core/dialogs.h"
#include "core/global.h"
#include "core/number_text.h"
#include "core/shutdown.h"
#include "core/windows.h"
#include "display/page_layout.h"
#include "ost7720.h"
#include "ost7720_codes.h"

namespace {

namespace code = ost7720_code;

struct InputMode {
    const char* name;
    int32_t code;
};
constexpr InputMode input_modes[] = {
    {"VOLT", 130}, {"ICP", 131}, {"CHARGE", 132}, {"MIC", 133}, {"MIC_200V", 134},
};

// Room kept between a label and its field, and between a field and the next column, in twips.
constexpr double label_gap = 60;
constexpr double column_gap = 100;

constexpr double range_floor = 0.0;
constexpr double range_ceiling = 20.0;

// The texts the fields must show whole: the fixed texts of the two disabled boxes and the
// longest list entries.
constexpr const char* widest_field_texts[] = {"On Breakout Box", "Not Adjustable", "AC Coupling",
                                              "DC Coupling",     "Neg/Enter",      "MIC_200V"};

QString qtext(const std::string& text) {
    return QString::fromStdString(text);
}

std::string trim_trailing_blanks(std::string text) {
    text.erase(text.find_last_not_of(' ') + 1);
    return text;
}

std::string trim_blanks(const std::string& text) {
    const size_t first = text.find_first_not_of(' ');
    if (first == std::string::npos)
        return {};
    return text.substr(first, text.find_last_not_of(' ') - first + 1);
}

std::string channel_refusal(const std::string& typed) {
    std::string text = "Channel number " + trim_blanks(typed) + " is not an input channel of this session.";
    if (global::num_inputs > 0)
        text += "\r\nChoose a channel number from 1 to " + numtext::text(global::num_inputs) + ".";
    return text;
}

}  // namespace

InputFrm::InputFrm() : Form(QStringLiteral("Input Setup")) {
    auto label = [this](const char* caption) { return new QLabel(QString::fromUtf8(caption), this); };
    auto combo = [this](std::initializer_list<const char*> entries) {
        auto* box = new QComboBox(this);
        box->setEditable(true);
        box->setInsertPolicy(QComboBox::NoInsert);
        // Choices are compared letter case included, so completion must not change the case typed.
        box->completer()->setCaseSensitivity(Qt::CaseSensitive);
        for (const char* entry : entries)
            box->addItem(QString::fromUtf8(entry));
        box->resize(box->width(), box->sizeHint().height());
        return box;
    };
    auto field = [this] {
        auto* box = new QLineEdit(this);
        box->resize(box->width(), box->sizeHint().height());
        return box;
    };

    AllSameChk = new QCheckBox(QStringLiteral("All Channels Match"), this);
    ChanNumLbl = label("Chan Number");
    ChnNumCmbo = combo({});
    RngLbl = label("Range");
    RangeTxt = field();
    couplbl = label("Coupling");
    CoupCmbo = combo({"AC Coupling", "DC Coupling"});
    gndlbl = label("Grounding");
    GndCmbo = combo({"Floating", "Grounded"});
    GndCmbo->setEditText(QStringLiteral("On Breakout Box"));
    DAALbl = label("Digital  Anti Alias");
    DAACmbo = combo({"On", "Off"});
    AAALbl = label("Analog  Anti Alias");
    AAACmbo = combo({"On", "Off"});
    AAACmbo->setEditText(QStringLiteral("Not Adjustable"));
    // Where a narrow window cuts the two fixed texts short, their start stays in view.
    GndCmbo->lineEdit()->setCursorPosition(0);
    AAACmbo->lineEdit()->setCursorPosition(0);
    inpmodeLbl = label("Input Mode");
    inpmodeCmbo = combo({"VOLT", "ICP", "CHARGE", "MIC", "MIC_200V"});
    inpmodeCmbo->setEditText(QStringLiteral("Combo1"));
    TrigOnLbl = label("Trigger");
    TrigOnCmbo = combo({"OFF", "ON"});
    TrigModeLbl = label("Trig Mode");
    TrigModeCmbo = combo({"Level", "Bound"});
    TrigLvlLbl = label("Trig Level (%)");
    TrigLvlTxt = field();
    HystLbl = label("Hysteresis (%)");
    HystTxt = field();
    TrigDirLbl = label("Trig Slope");
    TrigDirCmbo = combo({"Pos/Exit", "Neg/Enter"});
    doneBtn = new QPushButton(QStringLiteral("OK"), this);
    cancelBtn = new QPushButton(QStringLiteral("Cancel"), this);

    // clicked, not stateChanged: load_controls sets the box itself and must not run the handler.
    connect(AllSameChk, &QCheckBox::clicked, this, &InputFrm::AllSameChk_Click);
    connect(doneBtn, &QPushButton::clicked, this, &InputFrm::doneBtn_Click);
    connect(cancelBtn, &QPushButton::clicked, this, &InputFrm::cancelBtn_Click);
    Form_Load();
}

void InputFrm::Form_Load() {
    cur_chan = 1;
}

double InputFrm::field_width() const {
    // What an editable combo box takes beside its text: frame, arrow and the edit's margins.
    QStyleOptionComboBox option;
    option.initFrom(CoupCmbo);
    option.editable = true;
    option.subControls = QStyle::SC_All;
    constexpr int probe_width = 400;
    option.rect = QRect(0, 0, probe_width, CoupCmbo->height());
    const QRect edit = CoupCmbo->style()->subControlRect(QStyle::CC_ComboBox, &option,
                                                         QStyle::SC_ComboBoxEditField, CoupCmbo);
    constexpr int edit_margins = 2 * 2 + 6;
    int text = 0;
    for (const char* t : widest_field_texts)
        text = std::max(text, CoupCmbo->fontMetrics().horizontalAdvance(QString::fromUtf8(t)));
    return (text + probe_width - edit.width() + edit_margins) * twips_per_pixel_x();
}

void InputFrm::Form_Resize() {
    struct Row {
        QLabel* label;
        QWidget* field;
        int16_t index;
    };
    const Row rows[] = {
        {ChanNumLbl, ChnNumCmbo, 1},  {RngLbl, RangeTxt, 2},      {couplbl, CoupCmbo, 3},
        {gndlbl, GndCmbo, 4},         {DAALbl, DAACmbo, 5},       {AAALbl, AAACmbo, 6},
        {inpmodeLbl, inpmodeCmbo, 8}, {TrigOnLbl, TrigOnCmbo, 9}, {TrigModeLbl, TrigModeCmbo, 10},
        {TrigLvlLbl, TrigLvlTxt, 11}, {HystLbl, HystTxt, 12},     {TrigDirLbl, TrigDirCmbo, 13},
    };
    for (const Row& row : rows) {
        place_in_grid(*this, row.label, row.index, 1);
        place_in_grid(*this, row.field, row.index, 2);
        if (row.field == GndCmbo)
            GndCmbo->setEnabled(false);
        if (row.field == AAACmbo)
            AAACmbo->setEnabled(false);
    }
    // The grid fixes only where a field starts. In a narrow window a label can be wider than the
    // room the grid leaves it: the fields of that column then start after their widest label
    // rather than covering its end. Every field is wide enough for the longest fixed text, but
    // never reaches into the labels of the next column or past the right margin.
    const double column_unit = ScaleWidth() / 12;
    const double wanted = field_width();
    for (const bool second : {false, true}) {
        double left = 0;
        double label_end = 0;
        for (const Row& row : rows) {
            if ((row.index >= 8) != second)
                continue;
            left = twips::left(row.field);
            label_end = std::max(label_end, twips::left(row.label) + twips::width(row.label));
        }
        left = std::max(left, label_end + label_gap);
        const double column_end = (second ? 11.5 : 5.5) * column_unit;
        const double width = std::min(wanted, column_end - column_gap - left);
        for (const Row& row : rows) {
            if ((row.index >= 8) != second)
                continue;
            twips::set_left(row.field, left);
            twips::set_width(row.field, width);
        }
    }
    place_ok_cancel(*this, doneBtn, cancelBtn);
    place_in_grid(*this, AllSameChk, 0, 0);
    AllSameChk->setText(QStringLiteral("All Channels Identical"));
    AllSameChk->resize(AllSameChk->sizeHint());
    load_controls();
}

void InputFrm::load_controls() {
    using namespace global;
    AllSameChk->setChecked(all_channels_match == flag_true);

    ChnNumCmbo->clear();
    for (int32_t k = 1; k <= num_inputs; ++k)
        ChnNumCmbo->addItem(qtext(numtext::text(k)));
    int32_t channel = 1;
    if (all_channels_match == flag_true) {
        ChnNumCmbo->setEditText(QStringLiteral("ALL"));
        ChnNumCmbo->setEnabled(false);
    } else {
        ChnNumCmbo->setEditText(qtext(numtext::text(cur_chan)));
        ChnNumCmbo->setEnabled(true);
        channel = cur_chan;
    }

    int32_t coupling = 0;
    status = ost7720_getCoupling(session, channel, &coupling);
    driver_ok("ost7720_getCoupling");
    CoupCmbo->setEditText(coupling == code::coupling_ac ? QStringLiteral("AC Coupling")
                                                        : QStringLiteral("DC Coupling"));

    int32_t filter = 0;
    status = ost7720_getAntiAliasDigital(session, channel, &filter);
    driver_ok("ost7720_getAntiAliasDigital");
    DAACmbo->setEditText(filter == code::anti_alias_on ? QStringLiteral("ON") : QStringLiteral("OFF"));

    double range = 0;
    status = ost7720_getRange(session, channel, &range);
    driver_ok("ost7720_getRange");
    RangeTxt->setText(qtext(numtext::text(range)));

    int32_t trigger = 0;
    status = ost7720_getTriggerChannel(session, channel, &trigger);
    driver_ok("ost7720_getTriggerChannel");
    TrigOnCmbo->setEditText(trigger == code::off ? QStringLiteral("OFF") : QStringLiteral("ON"));

    double lower = 0;
    double upper = 0;
    status = ost7720_getTriggerLevel(session, channel, code::level_lower, &lower);
    driver_ok("ost7720_getTriggerLevel");
    status = ost7720_getTriggerLevel(session, channel, code::level_upper, &upper);
    driver_ok("ost7720_getTriggerLevel");

    // The level shown is the one the slope fires at; the hysteresis is the distance to the other.
    int32_t slope = 0;
    status = ost7720_getTriggerSlope(session, channel, &slope);
    driver_ok("ost7720_getTriggerSlope");
    if (slope == code::slope_positive) {
        TrigDirCmbo->setEditText(QStringLiteral("Pos/Exit"));
        TrigLvlTxt->setText(qtext(numtext::str(upper)));
    } else {
        TrigDirCmbo->setEditText(QStringLiteral("Neg/Enter"));
        TrigLvlTxt->setText(qtext(numtext::str(lower)));
    }
    HystTxt->setText(qtext(numtext::str(upper - lower)));

    int32_t mode = 0;
    status = ost7720_getTriggerMode(session, channel, &mode);
    driver_ok("ost7720_getTriggerMode");
    TrigModeCmbo->setEditText(mode == code::trigger_level ? QStringLiteral("Level")
                                                          : QStringLiteral("Bound"));

    int32_t input_mode = 0;
    status = ost7720_getInputMode(session, channel, &input_mode);
    driver_ok("ost7720_getInputMode");
    // A mode the page has no name for leaves the text as it was.
    for (const InputMode& m : input_modes)
        if (m.code == input_mode)
            inpmodeCmbo->setEditText(QString::fromUtf8(m.name));
}

void InputFrm::AllSameChk_Click() {
    global::all_channels_match = AllSameChk->isChecked() ? global::flag_true : global::flag_false;
    Form_Resize();
}

void InputFrm::doneBtn_Click() {
    using namespace global;
    int32_t target = group_inputs;
    if (all_channels_match != flag_true) {
        // A number beyond 16 bits would wrap round to some other channel: refuse it and send
        // nothing. A number that fits goes to the driver, which refuses a channel it lacks.
        const std::string typed = ChnNumCmbo->currentText().toStdString();
        const std::optional<int16_t> channel = numtext::to_int16(numtext::val(typed));
        if (!channel) {
            dialogs::notice(channel_refusal(typed));
            return;
        }
        cur_chan = *channel;
        target = cur_chan;
    }

    const double range = std::clamp(numtext::val(RangeTxt->text().toStdString()), range_floor, range_ceiling);
    status = ost7720_setRange(session, target, range);
    driver_ok("ost7720_setRange");

    status = ost7720_setCoupling(
        session, target,
        CoupCmbo->currentText() == QStringLiteral("AC Coupling") ? code::coupling_ac : code::coupling_dc);
    driver_ok("ost7720_setCoupling");

    const bool filter = DAACmbo->currentText().compare(QStringLiteral("ON"), Qt::CaseInsensitive) == 0;
    status =
        ost7720_setAntiAliasDigital(session, target, filter ? code::anti_alias_on : code::anti_alias_off);
    driver_ok("ost7720_setAntiAliasDigital");

    const bool positive = TrigDirCmbo->currentText() == QStringLiteral("Pos/Exit");
    status = ost7720_setTriggerSlope(session, target, positive ? code::slope_positive : code::slope_negative);
    driver_ok("ost7720_setTriggerSlope");

    status = ost7720_setTriggerChannel(
        session, target, TrigOnCmbo->currentText() == QStringLiteral("OFF") ? code::off : code::on);
    driver_ok("ost7720_setTriggerChannel");

    // A mode text that names no mode is not sent: any code chosen for it could be the wrong
    // mode for the sensor on the channel. The channel keeps the mode it has.
    const std::string mode_text = trim_trailing_blanks(inpmodeCmbo->currentText().toStdString());
    for (const InputMode& m : input_modes) {
        if (mode_text == m.name) {
            status = ost7720_setInputMode(session, target, m.code);
            driver_ok("ost7720_setInputMode");
            break;
        }
    }

    status = ost7720_setTriggerMode(
        session, target,
        TrigModeCmbo->currentText() == QStringLiteral("Level") ? code::trigger_level : code::trigger_bound);
    driver_ok("ost7720_setTriggerMode");

    const double level = numtext::val(TrigLvlTxt->text().toStdString());
    const double hysteresis = numtext::val(HystTxt->text().toStdString());
    const double lower = positive ? level - hysteresis : level;
    const double upper = positive ? level : level + hysteresis;
    status = ost7720_setTriggerLevel(session, target, code::level_lower, lower);
    driver_ok("ost7720_setTriggerLevel");
    status = ost7720_setTriggerLevel(session, target, code::level_upper, upper);
    driver_ok("ost7720_setTriggerLevel");

    switch_page(*this, forms::main_form());
}

void InputFrm::cancelBtn_Click() {
    switch_page(*this, forms::main_form());
}
