#include "pages/DispFrm.h"

#include <QCompleter>
#include <optional>

#include "core/global.h"
#include "core/number_text.h"
#include "core/windows.h"
#include "display/page_layout.h"

namespace {

// The channel a box's text selects: "OFF" (exactly) and text without a number give 0, the trace
// off. A number too large for a channel id also turns the trace off rather than wrapping round
// to some other channel.
int32_t channel_of(const std::string& text) {
    if (text == "OFF")
        return 0;
    std::optional<int32_t> channel = numtext::to_int32(numtext::val(text));
    return channel.value_or(0);
}

}  // namespace

DispFrm::DispFrm() : Form(QStringLiteral("Display Controls")) {
    auto label = [this](const QString& caption) {
        auto* l = new QLabel(caption, this);
        l->adjustSize();
        return l;
    };
    Label2 = label(QStringLiteral("Trace"));
    Label3 = label(QStringLiteral("Input Channel"));
    Label4 = label(QStringLiteral("Output File"));
    for (int i = 0; i < 4; ++i) {
        Label1[i] = label(QStringLiteral("Trace #%1").arg(i + 1));
        auto* box = new QComboBox(this);
        box->setEditable(true);
        box->setInsertPolicy(QComboBox::NoInsert);
        // Choices are compared letter case included, so completion must not turn "off" into "OFF".
        box->completer()->setCaseSensitivity(Qt::CaseSensitive);
        // Designed wide enough for "OFF" and a four-digit channel beside the drop-down arrow.
        box->setMinimumContentsLength(5);
        box->setSizeAdjustPolicy(QComboBox::AdjustToMinimumContentsLengthWithIcon);
        box->resize(box->sizeHint());
        box->setEditText(i == 0 ? QStringLiteral("TrcChanCmbo") : QStringLiteral("OFF"));
        TrcChanCmbo[i] = box;
        Text1[i] = new QLineEdit(this);
    }
    doneBtn = new QPushButton(QStringLiteral("OK"), this);
    cancelBtn = new QPushButton(QStringLiteral("Cancel"), this);
    connect(doneBtn, &QPushButton::clicked, this, &DispFrm::doneBtn_Click);
    connect(cancelBtn, &QPushButton::clicked, this, &DispFrm::cancelBtn_Click);
    Form_Load();
}

void DispFrm::Form_Load() {
    trace_choice[0] = "1";
    trace_choice[1] = trace_choice[2] = trace_choice[3] = "OFF";
}

void DispFrm::Form_Resize() {
    const double rh = ScaleHeight() / 7;
    const double cw = ScaleWidth() / 8;
    for (size_t i = 0; i < 4; ++i) {
        twips::set_left(Label1[i], cw);
        twips::set_top(Label1[i], static_cast<double>(i + 2) * rh);
        twips::set_height(Label1[i], TextHeight(QStringLiteral("test")));
        twips::set_width(Label1[i], TextWidth(Label1[i]->text()));

        twips::set_top(TrcChanCmbo[i], twips::top(Label1[i]));
        twips::set_left(TrcChanCmbo[i], 3 * cw);
        twips::set_width(TrcChanCmbo[i], twips::width(TrcChanCmbo[0]));

        twips::set_top(Text1[i], twips::top(Label1[i]));
        twips::set_left(Text1[i], 5 * cw);
        twips::set_height(Text1[i], TextHeight(QStringLiteral("W")) + 100);
        twips::set_width(Text1[i], 3 * cw - 50);
        Text1[i]->setText(QString::fromStdString(global::trace_file[i]));

        TrcChanCmbo[i]->clear();
        TrcChanCmbo[i]->addItem(QStringLiteral("OFF"));
        TrcChanCmbo[i]->setEditText(QString::fromStdString(trace_choice[i]));
    }
    for (int32_t k = 1; k <= global::num_inputs; ++k) {
        const QString number = QString::fromStdString(numtext::text(k));
        for (QComboBox* box : TrcChanCmbo)
            box->addItem(number);
    }
    for (QLabel* heading : {Label2, Label3, Label4})
        twips::set_top(heading, rh);
    twips::set_left(Label2, cw);
    twips::set_left(Label3, 3 * cw);
    twips::set_left(Label4, 5 * cw);
    place_ok_cancel(*this, doneBtn, cancelBtn);
}

void DispFrm::doneBtn_Click() {
    for (size_t i = 0; i < 4; ++i) {
        trace_choice[i] = TrcChanCmbo[i]->currentText().toStdString();
        global::trace_channel[i] = channel_of(trace_choice[i]);
        global::trace_file[i] = Text1[i]->text().toStdString();
    }
    switch_page(*this, forms::main_form());
}

void DispFrm::cancelBtn_Click() {
    switch_page(*this, forms::main_form());
}
