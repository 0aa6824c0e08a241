#include "display/MainFrm.h"

#include <QCloseEvent>
#include <QGuiApplication>
#include <QScreen>

#include "core/global.h"
#include "core/shutdown.h"
#include "core/startup.h"
#include "core/windows.h"

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

MainFrm::~MainFrm() {
    if (&forms::main_form() == this) forms::set_main_form(nullptr);
}

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
    if (global::num_inputs > 0) global::trace_channel[0] = 1;
    trace_update();
}

void MainFrm::Form_Resize() { trace_update(); }

void MainFrm::trace_update() {}
void MainFrm::hightxt_Change(int16_t) {}
void MainFrm::lowtxt_Change(int16_t) {}

void MainFrm::GoBtn_Click() {}
void MainFrm::TriggerBtn_Click() {}
void MainFrm::MainTimer_Timer() {}
void MainFrm::setup_data_wait() {}
void MainFrm::stop_measurement() {}
void MainFrm::MeasBtn_Click() {}
void MainFrm::InpBtn_Click() {}
void MainFrm::SrcBtn_Click() {}
void MainFrm::DispBtn_Click() {}
void MainFrm::VxiBtn_Click() {}

void MainFrm::ExitBtn_Click() { exit_panel(); }

void MainFrm::closeEvent(QCloseEvent* event) {
    event->ignore();
    exit_panel();
}
