#include "pages/SrcFrm.h"

#include <QCompleter>
#include <QEvent>
#include <QPalette>
#include <QScopedValueRollback>
#include <QStringList>
#include <algorithm>
#include <optional>
#include <string>
#include <vector>

#include "core/global.h"
#include "core/number_text.h"
#include "core/shutdown.h"
#include "core/windows.h"
#include "display/page_layout.h"
#include "ost7720.h"
#include "pages/source_programming.h"

namespace {

QString number_text(double value) {
    return QString::fromStdString(numtext::text(value));
}

QStringList names(const char* const* first, size_t count) {
    QStringList list;
    for (size_t i = 0; i < count; ++i)
        list << QString::fromUtf8(first[i]);
    return list;
}

// The highest source number the page can show.
int16_t source_count() {
    return static_cast<int16_t>(std::clamp<int32_t>(global::num_sources, 0, INT16_MAX));
}

}  // namespace

SrcFrm::SrcFrm() : Form(QStringLiteral("Source Setup")) {
    auto label = [this](const char* caption) { return new QLabel(QString::fromUtf8(caption), this); };
    auto combo = [this](const QStringList& items) {
        auto* box = new QComboBox(this);
        box->setEditable(true);
        box->setInsertPolicy(QComboBox::NoInsert);
        // Choices are compared letter case included, so completion must not change the case.
        box->completer()->setCaseSensitivity(Qt::CaseSensitive);
        box->addItems(items);
        box->setCurrentIndex(-1);
        return box;
    };
    auto text_box = [this] { return new QLineEdit(this); };

    ChanNumLbl = label("Chan Number");
    SrcWhoCmbo = combo({});
    // Completing a typed number to a longer one would pick another source mid-typing.
    SrcWhoCmbo->setCompleter(nullptr);
    ActiveLbl = label("Active");
    ActiveCmbo = combo({QStringLiteral("On"), QStringLiteral("Off")});
    ModeLbl = label("Mode");
    ModeCmbo = combo(names(srccode::mode_names.data(), srccode::mode_names.size()));
    RampLbl = label("Ramp Rate");
    RampRateTxt = text_box();
    FreqLbl = label("Sine Freq");
    FreqTxt = text_box();
    PhaseLbl = label("Sine Phase");
    PhaseTxt = text_box();
    OutputLbl = label("Output");
    OutputCmbo = combo(names(srccode::output_names.data(), srccode::output_names.size()));
    SrcTrigLbl = label("Trigger");
    SrcTrigCmbo = combo({QStringLiteral("Off"), QStringLiteral("On")});
    PresetBtn = new QPushButton(QStringLiteral("Default Values"), this);
    ApplyBtn = new QPushButton(QStringLiteral("Apply"), this);
    ColaLbl = label("Cola");
    ColaCmbo = combo({QStringLiteral("Off"), QStringLiteral("On")});
    DutyLbl = label("Duty Cycle");
    DutyTxt = text_box();
    SumLbl = label("Sum");
    SumCmbo = combo({QStringLiteral("On"), QStringLiteral("Off")});
    SeedLbl = label("Seed");
    SeedTxt = text_box();
    RangeLbl = label("Range");
    RangeTxt = text_box();
    NoteTxt = new QTextEdit(this);
    NoteTxt->setReadOnly(true);
    NoteTxt->setLineWrapMode(QTextEdit::NoWrap);
    NoteTxt->setHorizontalScrollBarPolicy(Qt::ScrollBarAlwaysOff);
    NoteTxt->document()->setDocumentMargin(2);
    {
        // Every load disables the box; its hints must still read as plainly as enabled text.
        QPalette pal = NoteTxt->palette();
        pal.setColor(QPalette::Disabled, QPalette::Text, pal.color(QPalette::Active, QPalette::Text));
        pal.setColor(QPalette::Disabled, QPalette::Base, pal.color(QPalette::Active, QPalette::Base));
        NoteTxt->setPalette(pal);
    }
    NoteTxt->hide();
    doneBtn = new QPushButton(QStringLiteral("OK"), this);
    cancelBtn = new QPushButton(QStringLiteral("Cancel"), this);

    connect(SrcWhoCmbo, &QComboBox::editTextChanged, this, &SrcFrm::SrcWhoCmbo_Change);
    connect(SrcWhoCmbo, &QComboBox::activated, this, &SrcFrm::SrcWhoCmbo_Click);
    // The combo hands its focus to its line edit; either may see the focus leave.
    SrcWhoCmbo->installEventFilter(this);
    SrcWhoCmbo->lineEdit()->installEventFilter(this);
    connect(PresetBtn, &QPushButton::clicked, this, &SrcFrm::PresetBtn_Click);
    connect(ApplyBtn, &QPushButton::clicked, this, &SrcFrm::ApplyBtn_Click);
    connect(doneBtn, &QPushButton::clicked, this, &SrcFrm::doneBtn_Click);
    connect(cancelBtn, &QPushButton::clicked, this, &SrcFrm::cancelBtn_Click);
    Form_Load();
}

SrcFrm::~SrcFrm() {
    // The children outlive this part of the page while they are torn down: no more checkwho.
    SrcWhoCmbo->removeEventFilter(this);
    SrcWhoCmbo->lineEdit()->removeEventFilter(this);
    disconnect(SrcWhoCmbo, nullptr, this, nullptr);
}

void SrcFrm::Form_Load() {
    cur_src = 0;
}

bool SrcFrm::eventFilter(QObject* watched, QEvent* event) {
    if (event->type() == QEvent::FocusOut && (watched == SrcWhoCmbo || watched == SrcWhoCmbo->lineEdit()))
        SrcWhoCmbo_LostFocus();
    return Form::eventFilter(watched, event);
}

void SrcFrm::Form_Resize() {
    place_ok_cancel(*this, doneBtn, cancelBtn);
    struct Row {
        int16_t position;
        QLabel* caption;
        QWidget* field;
    };
    const Row rows[] = {{0, ChanNumLbl, SrcWhoCmbo}, {1, ActiveLbl, ActiveCmbo},   {2, ModeLbl, ModeCmbo},
                        {3, RampLbl, RampRateTxt},   {4, FreqLbl, FreqTxt},        {5, PhaseLbl, PhaseTxt},
                        {6, OutputLbl, OutputCmbo},  {7, SrcTrigLbl, SrcTrigCmbo}, {13, SeedLbl, SeedTxt},
                        {10, ColaLbl, ColaCmbo},     {11, DutyLbl, DutyTxt},       {12, SumLbl, SumCmbo},
                        {14, RangeLbl, RangeTxt}};
    for (const Row& row : rows) {
        place_in_grid(*this, row.caption, row.position, 1);
        place_in_grid(*this, row.field, row.position, 2);
    }
    place_in_grid(*this, NoteTxt, 15, 0);
    place_in_grid(*this, PresetBtn, 8, 0);
    place_in_grid(*this, ApplyBtn, 9, 0);
    size_controls();
    load_controls();
}

void SrcFrm::size_controls() {
    const double cu = ScaleWidth() / 12;
    // Three grid columns leave half a column before the next caption, and "Burst Zoom Random"
    // fits beside the arrow at any usual window size.
    for (QWidget* field : std::initializer_list<QWidget*>{SrcWhoCmbo, ActiveCmbo, ModeCmbo, RampRateTxt,
                                                          FreqTxt, PhaseTxt, OutputCmbo, SrcTrigCmbo,
                                                          ColaCmbo, DutyTxt, SumCmbo, SeedTxt, RangeTxt}) {
        twips::set_width(field, 3 * cu);
        field->resize(field->width(), field->sizeHint().height());
    }
    // The two buttons match OK and Cancel, wider when their caption needs it.
    const double button_w =
        std::max(twips::width(doneBtn), TextWidth(PresetBtn->text()) + 16 * twips_per_pixel_x());
    for (QPushButton* b : {PresetBtn, ApplyBtn}) {
        twips::set_width(b, button_w);
        twips::set_height(b, twips::height(doneBtn));
    }
    // In windows below about 730 pixels the last grid row reaches down to where OK and Cancel
    // stand: they move down just below it, as far as the window allows.
    const double clear_top = twips::top(SrcTrigCmbo) + twips::height(SrcTrigCmbo) + 4 * twips_per_pixel_y();
    if (twips::top(doneBtn) < clear_top) {
        const double top = std::min(clear_top, ScaleHeight() - twips::height(doneBtn));
        twips::set_top(doneBtn, top);
        twips::set_top(cancelBtn, top);
    }
    // The hint box takes the rest of the second column down to a small margin at the bottom.
    twips::set_width(NoteTxt, ScaleWidth() - twips::left(NoteTxt) - cu / 2);
    twips::set_height(NoteTxt, ScaleHeight() - twips::top(NoteTxt) - 4 * twips_per_pixel_y());
}

void SrcFrm::load_controls() {
    using namespace global;
    QScopedValueRollback<bool> quiet(choosing_source_, true);
    SrcWhoCmbo->clear();
    const int16_t count = source_count();
    for (int16_t i = 1; i <= count; ++i)
        SrcWhoCmbo->addItem(number_text(i));
    if (cur_src < 1)
        cur_src = 1;
    if (cur_src > count)
        cur_src = count;
    if (cur_src == 0) {
        SrcWhoCmbo->setEditText(QStringLiteral("NONE"));
        return;
    }
    SrcWhoCmbo->setEditText(number_text(cur_src));
    const int32_t channel = source_ids[static_cast<size_t>(cur_src - 1)];
    std::vector<const char*> hints;
    int32_t code = 0;

    status = ost7720_getTriggerChannel(session, channel, &code);
    if (driver_ok("ost7720_getTriggerChannel"))
        SrcTrigCmbo->setEditText(code == srccode::off ? QStringLiteral("Off") : QStringLiteral("On"));

    status = ost7720_getSourceMode(session, channel, &code);
    if (driver_ok("ost7720_getSourceMode")) {
        const int32_t i = code - srccode::first_mode;
        if (i >= 0 && i < static_cast<int32_t>(srccode::mode_names.size()))
            ModeCmbo->setEditText(QString::fromUtf8(srccode::mode_names[static_cast<size_t>(i)]));
    }

    status = ost7720_getSourceOutput(session, channel, &code);
    if (driver_ok("ost7720_getSourceOutput")) {
        const int32_t i = code - srccode::first_output;
        if (i >= 0 && i < static_cast<int32_t>(srccode::output_names.size()))
            OutputCmbo->setEditText(QString::fromUtf8(srccode::output_names[static_cast<size_t>(i)]));
        if (code != srccode::first_output)
            hints.push_back("Output -> Normal");
    }

    status = ost7720_getSourceCola(session, channel, &code);
    if (driver_ok("ost7720_getSourceCola")) {
        if (code == srccode::cola_on)
            ColaCmbo->setEditText(QStringLiteral("On"));
        if (code == srccode::cola_off)
            ColaCmbo->setEditText(QStringLiteral("Off"));
    }

    status = ost7720_getSourceSum(session, channel, &code);
    if (driver_ok("ost7720_getSourceSum")) {
        if (code == srccode::sum_on)
            SumCmbo->setEditText(QStringLiteral("On"));
        if (code == srccode::sum_off)
            SumCmbo->setEditText(QStringLiteral("Off"));
    }

    status = ost7720_getActive(session, channel, &code);
    if (driver_ok("ost7720_getActive")) {
        ActiveCmbo->setEditText(code == srccode::on ? QStringLiteral("On") : QStringLiteral("Off"));
        if (code != srccode::on)
            hints.push_back("Active -> On");
    }

    double value = 0;
    status = ost7720_getRampRate(session, channel, &value);
    if (driver_ok("ost7720_getRampRate")) {
        RampRateTxt->setText(number_text(value));
        if (value > 0)
            hints.push_back("RampRate -> 0");
    }

    status = ost7720_getRange(session, channel, &value);
    if (driver_ok("ost7720_getRange")) {
        RangeTxt->setText(number_text(value));
        if (value < 1.0)
            hints.push_back("Range -> higher");
    }

    status = ost7720_getSineFreq(session, channel, &value);
    if (driver_ok("ost7720_getSineFreq")) {
        FreqTxt->setText(number_text(value));
        if (value < 100.0)
            hints.push_back("Freq -> higher");
    }

    status = ost7720_getSinePhase(session, channel, &value);
    if (driver_ok("ost7720_getSinePhase"))
        PhaseTxt->setText(number_text(value));

    int32_t seed = 0;
    status = ost7720_getSourceSeed(session, channel, &seed);
    if (driver_ok("ost7720_getSourceSeed"))
        SeedTxt->setText(number_text(seed));

    status = ost7720_getDutyCycle(session, channel, &value);
    if (driver_ok("ost7720_getDutyCycle")) {
        DutyTxt->setText(number_text(value));
        if (value < 0.5)
            hints.push_back("Duty Cycle -> 1");
    }

    NoteTxt->setEnabled(false);
    if (hints.empty()) {
        NoteTxt->hide();
        return;
    }
    // One hint a line under the heading. The box would show the break after the last hint as
    // an empty line, which only costs room, so the text ends with the last hint.
    QString note = QStringLiteral("No Source?  Try:");
    for (const char* hint : hints)
        note += QLatin1Char('\n') + QString::fromUtf8(hint);
    NoteTxt->setPlainText(note);
    NoteTxt->show();
}

void SrcFrm::checkwho() {
    if (choosing_source_)
        return;
    QScopedValueRollback<bool> quiet(choosing_source_, true);
    const std::optional<int16_t> typed =
        numtext::to_int16(numtext::val(SrcWhoCmbo->currentText().toStdString()));
    int16_t n = typed.value_or(0);
    if (n < 1)
        n = 1;
    if (n > source_count())
        n = source_count();
    if (n == cur_src)
        return;
    cur_src = n;
    SrcWhoCmbo->setEditText(n == 0 ? QStringLiteral("NONE") : number_text(n));
    load_controls();
}

void SrcFrm::SrcWhoCmbo_Change() {
    checkwho();
}

void SrcFrm::SrcWhoCmbo_Click() {
    checkwho();
}

void SrcFrm::SrcWhoCmbo_LostFocus() {
    checkwho();
    // A number that came out as the source already shown (7 of 3 sources while 3 is shown)
    // leaves checkwho nothing to do; left standing, it would make OK and Apply write nothing.
    // Leaving the box shows the source the page holds, without reloading it.
    const QString shown = cur_src == 0 ? QStringLiteral("NONE") : number_text(cur_src);
    if (SrcWhoCmbo->currentText() != shown) {
        QScopedValueRollback<bool> quiet(choosing_source_, true);
        SrcWhoCmbo->setEditText(shown);
    }
}

void SrcFrm::PresetBtn_Click() {
    using namespace global;
    if (num_sources > 0 && cur_src >= 1 && cur_src <= num_sources) {
        status = ost7720_preset(session, source_ids[static_cast<size_t>(cur_src - 1)]);
        driver_ok("ost7720_preset");
    }
    load_controls();
}

void SrcFrm::doneBtn_Click() {
    // Written, read back, and written once more as read back.
    setupsource();
    load_controls();
    setupsource();
    switch_page(*this, forms::main_form());
}

void SrcFrm::ApplyBtn_Click() {
    doneBtn_Click();
    switch_page(forms::main_form(), *this);
}

void SrcFrm::cancelBtn_Click() {
    switch_page(*this, forms::main_form());
}
