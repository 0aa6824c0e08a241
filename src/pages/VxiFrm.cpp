#include "pages/VxiFrm.h"

#include <QCursor>
#include <QStyle>
#include <algorithm>
#include <array>
#include <cmath>

#include "core/dialogs.h"
#include "core/global.h"
#include "core/number_text.h"
#include "core/startup.h"
#include "core/windows.h"
#include "display/page_layout.h"

namespace {

QString number_text(int32_t value) {
    return QString::fromStdString(numtext::text(value));
}

// The page is divided into 20 rows below 16 modules and into count + 10 rows from 16 on, the
// rows of module i starting at row i + 3. With 14 or 15 modules twenty rows would run into the
// OK button, so the rows then shrink to the whole pixels that end above it.
double row_divisor(int32_t module_count, double inner_height, double ok_top, double twips_per_pixel) {
    const double rule = module_count < 16 ? 20.0 : static_cast<double>(module_count) + 10.0;
    const double rows_end = static_cast<double>(module_count) + 4.0;
    if (rows_end * inner_height / rule <= ok_top)
        return rule;
    const double row_pixels = std::floor(ok_top / rows_end / twips_per_pixel);
    if (row_pixels < 1)
        return rule;
    return inner_height / (row_pixels * twips_per_pixel);
}

// Sets a display box to its designed width, or wider when the style's frame and margins would
// otherwise cut its text.
void fit_width(QLineEdit* box, double designed_twips) {
    twips::set_width(box, designed_twips);
    const int frame = box->style()->pixelMetric(QStyle::PM_DefaultFrameWidth, nullptr, box);
    const int needed = box->fontMetrics().horizontalAdvance(box->text()) + 2 * frame + 2 * 2 + 2;
    if (box->width() < needed)
        box->resize(needed, box->height());
}

}  // namespace

VxiFrm::VxiFrm() : Form(QStringLiteral("VXI setup")) {
    revtxt = new QLineEdit(QStringLiteral("-----"), this);
    RNameTxt = new QLineEdit(QStringLiteral("-----"), this);
    // Both only display what the session reports.
    revtxt->setReadOnly(true);
    RNameTxt->setReadOnly(true);
    cancelBtn = new QPushButton(QStringLiteral("Cancel"), this);
    doneBtn = new QPushButton(QStringLiteral("OK"), this);
    revlbl = new QLabel(QStringLiteral("Driver Rev."), this);
    VName = new QLabel(QStringLiteral("Resource Name"), this);
    // The two captions stand as tall as the boxes they name, so the texts line up.
    for (QLabel* caption : {revlbl, VName}) {
        caption->adjustSize();
        caption->resize(caption->width(), RNameTxt->sizeHint().height());
    }
    connect(doneBtn, &QPushButton::clicked, this, &VxiFrm::doneBtn_Click);
    connect(cancelBtn, &QPushButton::clicked, this, &VxiFrm::cancelBtn_Click);
    Form_Load();
}

void VxiFrm::Form_Load() {
    const auto rows = static_cast<size_t>(std::max<int32_t>(global::module_count, 0)) + 1;
    auto label = [this](const char* caption) {
        auto* l = new QLabel(QString::fromUtf8(caption), this);
        l->hide();
        return l;
    };
    const bool first = LALbl.empty();
    while (LALbl.size() < rows) {
        const auto index = static_cast<int16_t>(LALbl.size());
        // The address column keeps its designed width: the head's caption, or a logical address
        // (at most three digits) in a row, which must stay clear of the check box half a column on.
        LALbl.push_back(label("Label1"));
        twips::set_width(LALbl.back(), index == 0 ? TextWidth(QStringLiteral("Address")) + 100
                                                  : TextWidth(QStringLiteral("888")));
        auto* use = new QCheckBox(QStringLiteral("Check1"), this);
        use->hide();
        connect(use, &QCheckBox::clicked, this, [this, index] { UseCkbx_Click(index); });
        UseCkbx.push_back(use);
        InpLbl.push_back(label("inputs"));
        SrcLbl.push_back(label("sources"));
        TachLbl.push_back(label("tachs"));
        MemLbl.push_back(label("mem label"));
    }
    if (!first)
        return;
    LALbl[0]->setText(QStringLiteral("Address"));
    UseCkbx[0]->hide();
    UseCkbx[0]->setEnabled(false);
    InpLbl[0]->setText(QStringLiteral("Inputs"));
    SrcLbl[0]->setText(QStringLiteral("Sources"));
    TachLbl[0]->setText(QStringLiteral("Tachs"));
    MemLbl[0]->setText(QStringLiteral("Memory"));
    // The heads are sized to their captions; the designed sizes were for other texts.
    for (QLabel* head : {InpLbl[0], SrcLbl[0], TachLbl[0], MemLbl[0]}) {
        head->adjustSize();
        head->show();
    }
    LALbl[0]->show();
}

void VxiFrm::Form_Resize() {
    using namespace global;
    Form_Load();
    const double w = ScaleWidth();
    const double h = ScaleHeight();
    const double outer_h = Height();
    // OK goes first: the module rows must end above it.
    place_ok_cancel(*this, doneBtn, cancelBtn);
    cancelBtn->hide();
    cancelBtn->setEnabled(false);
    const double rows = row_divisor(module_count, h, twips::top(doneBtn), twips_per_pixel_y());
    const double x = w / 10;
    auto tw = [this](const QString& s) { return TextWidth(s); };

    for (size_t i = 1; i < LALbl.size(); ++i) {
        const size_t k = i - 1;
        LALbl[i]->setText(number_text(module_address[k]));
        const bool in_use = module_use[k] == flag_true;
        UseCkbx[i]->setChecked(in_use);
        UseCkbx[i]->setText(in_use ? QStringLiteral("Active") : QStringLiteral("Inactive"));
        twips::set_width(UseCkbx[i], tw(UseCkbx[i]->text()) + 500);
        InpLbl[i]->setText(number_text(module_inputs[k]));
        SrcLbl[i]->setText(number_text(module_sources[k]));
        TachLbl[i]->setText(number_text(module_tachs[k]));
        MemLbl[i]->setText(QString::fromStdString(module_memory[k]));
        for (QLabel* l : {InpLbl[i], SrcLbl[i], TachLbl[i], MemLbl[i]})
            twips::set_width(l, tw(l->text()) + 100);

        const std::array<QWidget*, 6> row = {LALbl[i],  UseCkbx[i], InpLbl[i],
                                             SrcLbl[i], TachLbl[i], MemLbl[i]};
        for (QWidget* c : row)
            twips::set_height(c, h / rows);
        const double top = static_cast<double>(i + 3) * twips::height(LALbl[i]);
        for (QWidget* c : row)
            twips::set_top(c, top);
        twips::set_left(LALbl[i], x);
        twips::set_left(UseCkbx[i], 1.5 * x);
        twips::set_left(InpLbl[i], 3 * x);
        twips::set_left(SrcLbl[i], 4 * x);
        twips::set_left(TachLbl[i], 5 * x);
        twips::set_left(MemLbl[i], 6 * x);
        for (QWidget* c : row)
            c->show();
    }

    const std::array<QWidget*, 6> heads = {LALbl[0], UseCkbx[0], InpLbl[0], SrcLbl[0], TachLbl[0], MemLbl[0]};
    for (QWidget* c : heads)
        twips::set_height(c, outer_h / rows);
    const double head_top = 2 * twips::height(LALbl[0]);
    for (QWidget* c : heads)
        twips::set_top(c, head_top);
    twips::set_left(LALbl[0], x);
    twips::set_left(UseCkbx[0], 2 * x);
    twips::set_left(InpLbl[0], 3 * x);
    twips::set_left(SrcLbl[0], 4 * x);
    twips::set_left(TachLbl[0], 5 * x);
    twips::set_left(MemLbl[0], 6 * x);

    const double line_top = twips::height(LALbl[0]);
    for (QWidget* c : {static_cast<QWidget*>(VName), static_cast<QWidget*>(RNameTxt),
                       static_cast<QWidget*>(revlbl), static_cast<QWidget*>(revtxt)})
        twips::set_top(c, line_top);
    twips::set_left(VName, x);
    twips::set_width(VName, tw(VName->text()) + 100);
    twips::set_left(RNameTxt, twips::width(VName) + x);
    RNameTxt->setText(QString::fromStdString(interface_name));
    fit_width(RNameTxt, tw(RNameTxt->text()) + 100);
    twips::set_left(revlbl, twips::left(RNameTxt) + twips::width(RNameTxt) + x);
    twips::set_left(revtxt, twips::left(revlbl) + twips::width(revlbl) + 100);
    revtxt->setText(QString::fromStdString(driver_revision));
    fit_width(revtxt, tw(revtxt->text()) + 100);
}

void VxiFrm::UseCkbx_Click(int16_t Index) {
    const auto i = static_cast<size_t>(Index);
    if (!UseCkbx[i]->isChecked()) {
        UseCkbx[i]->setText(QStringLiteral("Inactive"));
        global::module_use[i - 1] = global::flag_false;
    } else {
        UseCkbx[i]->setText(QStringLiteral("Active"));
        global::module_use[i - 1] = global::flag_true;
    }
}

void VxiFrm::doneBtn_Click() {
    doneBtn->setText(QStringLiteral("WAIT"));
    doneBtn->setCursor(Qt::WaitCursor);
    do_events();
    open_session();
    switch_page(*this, forms::main_form());
    doneBtn->setText(QStringLiteral("OK"));
    doneBtn->unsetCursor();
}

void VxiFrm::cancelBtn_Click() {
    switch_page(*this, forms::main_form());
}
