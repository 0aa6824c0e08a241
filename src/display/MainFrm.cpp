#include "display/MainFrm.h"

#include <QCloseEvent>
#include <QGuiApplication>
#include <QScreen>

#include <climits>
#include <span>

#include "core/global.h"
#include "core/number_text.h"
#include "core/shutdown.h"
#include "core/startup.h"
#include "core/windows.h"
#include "display/trace_plot.h"

namespace {

// A layout metric: rounded half to even, saturated instead of overflowing.
int32_t layout_metric(double twips) {
    if (auto r = numtext::to_int32(twips))
        return *r;
    return twips < 0 ? INT32_MIN : INT32_MAX;
}

// The trace screens look like an instrument's display: a dark screen with a bright trace.
void style_screen(PictureBox* pic) {
    QPalette pal = pic->palette();
    for (auto group : {QPalette::Active, QPalette::Inactive, QPalette::Disabled}) {
        pal.setColor(group, QPalette::Base, QColor(10, 18, 14));
        pal.setColor(group, QPalette::Text, QColor(96, 255, 128));
    }
    pic->setPalette(pal);
}

// The scale boxes read as the screen's scale: plain numbers beside its top and bottom edges,
// legible although the panel keeps them disabled.
void style_scale_box(QLineEdit* box) {
    box->setFrame(false);
    box->setAlignment(Qt::AlignRight | Qt::AlignVCenter);
    QPalette pal = box->palette();
    for (auto group : {QPalette::Active, QPalette::Inactive, QPalette::Disabled}) {
        pal.setColor(group, QPalette::Text, pal.color(QPalette::Active, QPalette::WindowText));
        pal.setColor(group, QPalette::Base, pal.color(QPalette::Active, QPalette::Window));
    }
    box->setPalette(pal);
}

}  // namespace

MainFrm::MainFrm() : Form(QStringLiteral("Ostrana K7720A Soft Front Panel")) {
    forms::set_main_form(this);
    MainTimer = new QTimer(this);
    MainTimer->setInterval(100);
    auto button = [this](const char* caption) { return new QPushButton(QString::fromUtf8(caption), this); };
    TriggerBtn = button("Trigger");
    VxiBtn = button("VXI");
    GoBtn = button("Go");
    ExitBtn = button("Exit");
    MeasBtn = button("Meas");
    DispBtn = button("Display");
    SrcBtn = button("Source");
    InpBtn = button("Input");
    for (int i = 0; i < 4; ++i) {
        CRTpic[i] = new PictureBox(this);
        HighTxt[i] = new QLineEdit(this);
        LowTxt[i] = new QLineEdit(this);
        ChanLbl[i] = new QLabel(QStringLiteral("Chan#"), this);
        style_screen(CRTpic[i]);
        style_scale_box(HighTxt[i]);
        style_scale_box(LowTxt[i]);
        ChanLbl[i]->resize(ChanLbl[i]->width(), ChanLbl[i]->fontMetrics().height());
        auto index = static_cast<int16_t>(i);
        connect(HighTxt[i], &QLineEdit::textChanged, this, [this, index] { hightxt_Change(index); });
        connect(LowTxt[i], &QLineEdit::textChanged, this, [this, index] { lowtxt_Change(index); });
    }
    connect(MainTimer, &QTimer::timeout, this, &MainFrm::MainTimer_Timer);
    connect(GoBtn, &QPushButton::clicked, this, &MainFrm::GoBtn_Click);
    connect(TriggerBtn, &QPushButton::clicked, this, &MainFrm::TriggerBtn_Click);
    connect(ExitBtn, &QPushButton::clicked, this, &MainFrm::ExitBtn_Click);
    connect(MeasBtn, &QPushButton::clicked, this, &MainFrm::MeasBtn_Click);
    connect(InpBtn, &QPushButton::clicked, this, &MainFrm::InpBtn_Click);
    connect(SrcBtn, &QPushButton::clicked, this, &MainFrm::SrcBtn_Click);
    connect(DispBtn, &QPushButton::clicked, this, &MainFrm::DispBtn_Click);
    connect(VxiBtn, &QPushButton::clicked, this, &MainFrm::VxiBtn_Click);
}

MainFrm::~MainFrm() { forms::forget_main_form(this); }

void MainFrm::Form_Load() {
    const QRect screen = QGuiApplication::primaryScreen()->geometry();
    const double sh = screen.height() * twips_per_pixel_y();
    const double sw = screen.width() * twips_per_pixel_x();
    setHeight(sh * 2 / 3);
    setWidth(sw * 2 / 3);
    setTop(sh / 6);
    setLeft(sw / 6);
    MainTimer->stop();
    global::set_defaults();
    find_modules();
    open_session();
    if (global::num_inputs > 0)
        global::trace_channel[0] = 1;
    trace_update();
}

void MainFrm::Form_Resize() {
    if (Height() < 3000)
        setHeight(3000);
    if (Width() < 3000)
        setWidth(3000);

    global::trace_area_width = layout_metric(ScaleWidth() * 70 / 100);
    global::trace_area_left = layout_metric(ScaleWidth() * 10 / 100);
    global::trace_area_top = layout_metric(ScaleHeight() / 100);
    global::trace_area_height = layout_metric(ScaleHeight() * 70 / 100);

    // The button column in single precision; R is a whole number (64 bits: no overflow).
    const auto sw = static_cast<float>(ScaleWidth());
    const auto sh = static_cast<float>(ScaleHeight());
    const float bw = sw * 15 / 100;
    const float bh = sh * 5 / 100;
    const float bs = sh * 5 / 100 + 2 * sh / 100;
    const int64_t r = static_cast<int64_t>(global::trace_area_width) + global::trace_area_left;
    const auto bx = static_cast<float>(r + ((static_cast<float>(ScaleWidth() - r)) - bw) / 2);

    const std::array<QPushButton*, 5> column{MeasBtn, InpBtn, SrcBtn, DispBtn, VxiBtn};
    for (QPushButton* b : column)
        twips::set_left(b, bx);
    for (QPushButton* b : column)
        twips::set_width(b, bw);
    for (QPushButton* b : column)
        twips::set_height(b, bh);
    for (size_t k = 0; k < column.size(); ++k)
        twips::set_top(column[k], static_cast<float>(k + 1) * bs);

    twips::set_width(GoBtn, bw);
    twips::set_left(GoBtn, 50);
    twips::set_height(GoBtn, (ScaleHeight() - global::trace_area_top - global::trace_area_height) * 0.5);
    twips::set_top(GoBtn, ScaleHeight() - twips::height(GoBtn));

    twips::set_width(ExitBtn, bw);
    twips::set_height(ExitBtn, twips::height(GoBtn));
    twips::set_top(ExitBtn, twips::top(GoBtn));
    twips::set_left(ExitBtn, ScaleWidth() - 1.2 * bw);

    twips::set_width(TriggerBtn, twips::width(GoBtn));
    twips::set_height(TriggerBtn, twips::height(GoBtn));
    twips::set_left(TriggerBtn, (global::trace_area_width / 2.0 + global::trace_area_left) -
                                    twips::width(TriggerBtn) / 2);
    twips::set_top(TriggerBtn, static_cast<double>(static_cast<int64_t>(global::trace_area_top) +
                                                   global::trace_area_height + 50));

    // Run control enables Trigger while a manually triggered measurement waits.
    TriggerBtn->setVisible(global::trigger_source == 1);
    TriggerBtn->setEnabled(false);

    trace_update();
}

void MainFrm::trace_update() {
    int32_t npts = global::num_points;
    if (global::domain == 1)
        npts = numtext::to_int32(global::num_points / 2.0).value_or(0);

    std::array<int, 4> list{};
    int count = 0;
    for (int t = 0; t <= 3; ++t)
        if (global::trace_channel[t] > 0)
            list[count++] = t;

    for (int i = 0; i <= 3; ++i) {
        CRTpic[i]->setEnabled(false);
        CRTpic[i]->hide();
        HighTxt[i]->hide();
        LowTxt[i]->hide();
        HighTxt[i]->setEnabled(false);
        LowTxt[i]->setEnabled(false);
        ChanLbl[i]->hide();
        ChanLbl[i]->setEnabled(false);
    }
    for (int i = 0; i <= 3; ++i)
        slot_at_[i] = i < count ? list[i] : i;
    if (count < 1)
        return;

    const double box_height = TextHeight(QStringLiteral("test"));
    for (int i = 0; i < count; ++i) {
        const int t = list[i];
        const auto position = static_cast<int16_t>(i);
        PictureBox* pic = CRTpic[i];
        twips::set_left(pic, global::trace_area_left);
        twips::set_width(pic, global::trace_area_width);
        twips::set_height(pic,
                          static_cast<float>(static_cast<double>(global::trace_area_height) / count - 5));
        twips::set_top(pic,
                       static_cast<float>(global::trace_area_top +
                                          i * static_cast<double>(global::trace_area_height) / count + 5));
        pic->setEnabled(true);
        pic->show();

        QLineEdit* high = HighTxt[i];
        twips::set_left(high, 0 + 5);
        twips::set_top(high, twips::top(pic));
        high->setEnabled(false);
        high->show();
        twips::set_height(high, box_height);
        twips::set_width(high, global::trace_area_left);
        fill_scale_box(high, QString::fromStdString(numtext::text(global::trace_range[t])), position, true);

        // The box's bottom is level with the picture's bottom, using the height it is given.
        QLineEdit* low = LowTxt[i];
        twips::set_left(low, 0 + 5);
        twips::set_top(low, twips::top(pic) + twips::height(pic) - box_height);
        low->setEnabled(false);
        low->show();
        twips::set_height(low, box_height);
        twips::set_width(low, global::trace_area_left);
        fill_scale_box(low, QString::fromStdString(numtext::text(-global::trace_range[t])), position, false);

        QLabel* label = ChanLbl[i];
        label->show();
        label->setEnabled(true);
        twips::set_left(label, 0 + 5);
        twips::set_top(label, (twips::top(low) + twips::top(high)) / 2);
        const QString caption =
            QStringLiteral("Chan ") + QString::fromStdString(numtext::text(global::trace_channel[t]));
        label->setText(caption);
        twips::set_width(label, TextWidth(caption));

        if (global::trace_has_data[t] == global::flag_true && global::trace_channel[t] != 0) {
            plot_trace(*pic, 0, global::trace_high[t], npts, global::trace_high[t] - global::trace_low[t],
                       std::span<const float>(global::x_values),
                       std::span<const double>(global::trace_data(t)), npts);
            drawn_slot_[i] = t;
        } else if (drawn_slot_[i] != t) {
            // Another slot's drawing must not stand under this slot's label.
            pic->clear();
            drawn_slot_[i] = t;
        }
    }
}

void MainFrm::fill_scale_box(QLineEdit* box, const QString& text, int16_t position, bool high) {
    if (box->text() != text) {
        box->setText(text);  // the change handler runs from the text change
    } else if (high) {
        hightxt_Change(position);
    } else {
        lowtxt_Change(position);
    }
}

void MainFrm::hightxt_Change(int16_t Index) {
    if (Index >= 0 && Index <= 3)
        scale_box_changed(HighTxt[Index], global::trace_high, Index);
}

void MainFrm::lowtxt_Change(int16_t Index) {
    if (Index >= 0 && Index <= 3)
        scale_box_changed(LowTxt[Index], global::trace_low, Index);
}

void MainFrm::scale_box_changed(QLineEdit* box, std::array<double, 5>& limits, int16_t position) {
    // Text that is not a number is left as typed, and the limit keeps its value.
    const std::optional<double> value = numtext::to_number(box->text().toStdString());
    if (!value)
        return;
    limits[slot_at_[position]] = *value;
    // Rewriting the text fires this handler once more; that pass finds the same text. The
    // depth bound stops any text that would not read back the same from looping.
    const QString shown = QString::fromStdString(numtext::str(*value));
    if (box->text() != shown && rewrite_depth_ < 2) {
        ++rewrite_depth_;
        box->setText(shown);
        --rewrite_depth_;
    }
}

void MainFrm::ExitBtn_Click() {
    exit_panel();
}

void MainFrm::closeEvent(QCloseEvent* event) {
    event->ignore();
    exit_panel();
}
