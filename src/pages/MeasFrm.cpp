#include "pages/MeasFrm.h"

#include <algorithm>
#include <optional>

#include "core/dialogs.h"
#include "core/global.h"
#include "core/number_text.h"
#include "core/windows.h"
#include "display/page_layout.h"

namespace {

// Spans the module can take lie strictly between these.
constexpr double span_floor = 0.0;
constexpr double span_ceiling = 76801.0;

constexpr const char* repeat_notice =
    "Soft Front Panel does not support repeat and multi mainframe.\r\n"
    "\r\n"
    "This is a limitation of this example program, not the Plug&Play library\r\n"
    "\r\n"
    "Repeat has been turned off";

}  // namespace

MeasFrm::MeasFrm() : Form(QStringLiteral("Measurement Control")) {
    auto frame = [this](const char* caption) { return new QGroupBox(QString::fromUtf8(caption), this); };
    auto option = [](QGroupBox* in, const char* caption) {
        return new QRadioButton(QString::fromUtf8(caption), in);
    };
    mmcheck = new QCheckBox(QStringLiteral("Multi Mainframe"), this);
    mmcheck->adjustSize();
    DomFrm = frame("Domain");
    FreqBtn = option(DomFrm, "Frequency");
    TimeBtn = option(DomFrm, "Time");
    // Designed left of the domain buttons; the layout keeps it.
    twips::set_left(FreqBtn, 240);
    twips::set_left(TimeBtn, 240);
    SpanFrame = frame("Freq Span");
    SpanTxt = new QLineEdit(SpanFrame);
    BlocksizeFrame = frame("Blocksize");
    BlocksizeTxt = new QLineEdit(BlocksizeFrame);
    TrigFrame = frame("Trigger");
    SourceBtn = option(TrigFrame, "Source");
    InputBtn = option(TrigFrame, "Input");
    ManualBtn = option(TrigFrame, "Manual");
    AutoBtn = option(TrigFrame, "Auto");
    ModeFrame = frame("Mode");
    ContBtn = option(ModeFrame, "Continous");
    BlockBtn = option(ModeFrame, "Block ");
    MeasFrame = frame("Meas ");
    RepeatBtn = option(MeasFrame, "Repeat");
    SingleBtn = option(MeasFrame, "Single Block");
    cancelBtn = new QPushButton(QStringLiteral("Cancel"), this);
    doneBtn = new QPushButton(QStringLiteral("OK"), this);
    connect(doneBtn, &QPushButton::clicked, this, &MeasFrm::doneBtn_Click);
    connect(cancelBtn, &QPushButton::clicked, this, &MeasFrm::cancelBtn_Click);
}

void MeasFrm::load_Meas_Form() {
    using namespace global;
    (single_block == flag_true ? SingleBtn : RepeatBtn)->setChecked(true);
    (block_mode == flag_true ? BlockBtn : ContBtn)->setChecked(true);
    switch (trigger_source) {
        case 0:
            AutoBtn->setChecked(true);
            break;
        case 1:
            ManualBtn->setChecked(true);
            break;
        case 2:
            InputBtn->setChecked(true);
            break;
        case 3:
            SourceBtn->setChecked(true);
            break;
        default:
            break;
    }
    if (domain == 0)
        TimeBtn->setChecked(true);
    if (domain == 1)
        FreqBtn->setChecked(true);
    mmcheck->setChecked(multi_mainframe != 0);
    BlocksizeTxt->setText(QString::fromStdString(numtext::str(blocksize)));
    SpanTxt->setText(QString::fromStdString(numtext::str(span)));
}

void MeasFrm::doneBtn_Click() {
    using namespace global;
    single_block = SingleBtn->isChecked() ? flag_true : flag_false;
    block_mode = BlockBtn->isChecked() ? flag_true : flag_false;
    multi_mainframe = mmcheck->isChecked() ? 1 : 0;
    if (single_block == flag_false && multi_mainframe == 1) {
        dialogs::notice(repeat_notice);
        single_block = flag_true;
    }
    if (AutoBtn->isChecked()) {
        trigger_source = 0;
    } else if (ManualBtn->isChecked()) {
        trigger_source = 1;
    } else if (InputBtn->isChecked()) {
        trigger_source = 2;
    } else if (SourceBtn->isChecked()) {
        trigger_source = 3;
    }
    // A block size beyond 32 bits is no size the module can take: the old one stays, as for
    // any other size that is refused.
    std::optional<int32_t> size = numtext::to_int32(numtext::val(BlocksizeTxt->text().toStdString()));
    if (size && *size > 0)
        blocksize = *size;
    const double new_span = numtext::val(SpanTxt->text().toStdString());
    if (new_span > span_floor && new_span < span_ceiling)
        span = new_span;
    domain = TimeBtn->isChecked() ? 0 : 1;
    switch_page(*this, forms::main_form());
}

void MeasFrm::cancelBtn_Click() {
    switch_page(*this, forms::main_form());
}

void MeasFrm::Form_Resize() {
    const double w = ScaleWidth();
    const double h = ScaleHeight();
    constexpr double scale_left = 0;

    twips::set_width(DomFrm, 2 * TextWidth(QStringLiteral("Frequency")));
    twips::set_width(MeasFrame, 2 * TextWidth(QStringLiteral("Continous")));
    for (QGroupBox* f : {ModeFrame, TrigFrame, BlocksizeFrame, SpanFrame})
        twips::set_width(f, twips::width(MeasFrame));

    twips::set_left(MeasFrame, scale_left + w / 10);
    twips::set_left(ModeFrame, twips::left(MeasFrame));
    twips::set_left(TrigFrame, twips::left(MeasFrame));

    twips::set_left(BlocksizeFrame, twips::left(MeasFrame) + 1.5 * twips::width(MeasFrame));
    twips::set_left(SpanFrame, twips::left(BlocksizeFrame));
    twips::set_left(DomFrm, twips::left(BlocksizeFrame));

    twips::set_height(MeasFrame, 2 * h / 14);
    twips::set_height(ModeFrame, 2 * h / 14);
    twips::set_height(TrigFrame, 4 * h / 14);
    twips::set_height(BlocksizeFrame, 2 * h / 14);
    twips::set_height(SpanFrame, twips::height(BlocksizeFrame));
    twips::set_height(DomFrm, 2 * h / 14);

    twips::set_top(MeasFrame, h / 14);
    twips::set_top(ModeFrame, 4 * h / 14);
    twips::set_top(TrigFrame, 7 * h / 14);
    twips::set_top(DomFrm, twips::top(TrigFrame));
    twips::set_top(BlocksizeFrame, twips::top(ModeFrame));
    twips::set_top(SpanFrame, twips::top(MeasFrame));

    auto place = [this](QRadioButton* option, double top) {
        twips::set_top(option, top);
        size_option_button(*this, option);
        // The fixed allowance for the indicator is narrower than this style's indicator and gap;
        // never cut the caption short.
        option->resize(std::max(option->width(), option->sizeHint().width()), option->height());
    };
    const double meas_h = twips::height(MeasFrame);
    place(SingleBtn, meas_h / 3);
    place(RepeatBtn, 2 * meas_h / 3);
    const double mode_h = twips::height(ModeFrame);
    place(BlockBtn, mode_h / 3);
    place(ContBtn, 2 * mode_h / 3);
    const double trig_h = twips::height(TrigFrame);
    place(AutoBtn, trig_h / 5);
    place(ManualBtn, 2 * trig_h / 5);
    place(InputBtn, 3 * trig_h / 5);
    place(SourceBtn, 4 * trig_h / 5);
    for (QRadioButton* option :
         {SingleBtn, RepeatBtn, BlockBtn, ContBtn, AutoBtn, ManualBtn, InputBtn, SourceBtn})
        twips::set_left(option, 90);
    // The domain buttons keep their designed left.
    const double dom_h = twips::height(DomFrm);
    place(TimeBtn, dom_h / 3);
    place(FreqBtn, 2 * dom_h / 3);

    for (QLineEdit* box : {BlocksizeTxt, SpanTxt}) {
        twips::set_width(box, twips::width(BlocksizeFrame) - 100);
        twips::set_left(box, 50);
        twips::set_height(box, TextHeight(QStringLiteral("12342")) + 20);
        twips::set_top(box, twips::height(BlocksizeFrame) / 2);
    }

    twips::set_top(
        mmcheck,
        (twips::top(TrigFrame) + twips::height(TrigFrame) + twips::top(DomFrm) + twips::height(DomFrm)) / 2);
    twips::set_left(mmcheck, twips::left(DomFrm));

    place_ok_cancel(*this, doneBtn, cancelBtn);
}
