// Run control of the main window: Go, the 100 ms poll for blocks, the Trigger button and the
// page buttons, which stop any run before a page takes the main window's place.
#include "core/dialogs.h"
#include "core/global.h"
#include "core/shutdown.h"
#include "core/windows.h"
#include "display/MainFrm.h"
#include "display/output_files.h"
#include "measure/measurement.h"
#include "ost7720.h"
#include "pages/DispFrm.h"
#include "pages/InputFrm.h"
#include "pages/MeasFrm.h"
#include "pages/SrcFrm.h"
#include "pages/VxiFrm.h"

using global::flag_false;
using global::flag_true;

void MainFrm::GoBtn_Click() {
    if (global::running == 0) {
        setup_measurement();
        setup_data_wait();
        return;
    }
    stop_measurement();
    MainTimer->stop();
    global::running = flag_false;
    GoBtn->setText(QStringLiteral("Go"));
    TriggerBtn->setEnabled(false);
}

void MainFrm::setup_data_wait() {
    GoBtn->setText(QStringLiteral("Stop"));
    global::running = flag_true;
    MainTimer->start();
    do_events();
}

void MainFrm::MainTimer_Timer() {
    using namespace global;
    if (running == 0)
        return;
    int32_t available = 0;
    status = ost7720_blockAvailable(session, group_inputs, &available);
    if (status < 0)
        report_driver_error("ost7720_blockAvailable", status);
    if (available > 0) {
        MainTimer->stop();
        GoBtn->setText(QStringLiteral("Reading"));
        GoBtn->setEnabled(false);
        do_events();
        if (running != flag_true) {
            // A page button (or anything else) stopped the run while the caption was shown: the
            // measurement was reset, so there is no block left to read.
            GoBtn->setEnabled(true);
            return;
        }
        read_block();
        trace_update();
        if (single_block == flag_true) {
            stop_measurement();
            running = flag_false;
            GoBtn->setText(QStringLiteral("Go"));
            GoBtn->setEnabled(true);
            int16_t append = flag_false;
            write_trace_files(append);
        } else {
            MainTimer->start();
            GoBtn->setText(QStringLiteral("Stop"));
            GoBtn->setEnabled(true);
            int16_t append = flag_true;
            write_trace_files(append);
        }
        do_events();
    }
    if (!TriggerBtn->isEnabled() && running == flag_true && trigger_source == 1)
        TriggerBtn->setEnabled(true);
}

void MainFrm::TriggerBtn_Click() {
    using namespace global;
    if (trigger_source != 1 || running != flag_true)
        return;
    status = ost7720_triggerMeasure(session, group_all, 0);
    driver_ok("ost7720_triggerMeasure");
    TriggerBtn->setEnabled(false);
}

void MainFrm::stop_measurement() {
    using namespace global;
    MainTimer->stop();
    running = flag_false;
    GoBtn->setText(QStringLiteral("Go"));
    TriggerBtn->setEnabled(false);
    if (group_all != 0) {
        status = ost7720_resetMeasure(session, group_all);
        driver_ok("ost7720_resetMeasure");
    }
}

void MainFrm::MeasBtn_Click() {
    stop_measurement();
    MeasFrm& page = forms::get<MeasFrm>();
    page.load_Meas_Form();
    switch_page(*this, page);
}

void MainFrm::InpBtn_Click() {
    stop_measurement();
    switch_page(*this, forms::get<InputFrm>());
}

void MainFrm::SrcBtn_Click() {
    stop_measurement();
    switch_page(*this, forms::get<SrcFrm>());
}

void MainFrm::DispBtn_Click() {
    stop_measurement();
    switch_page(*this, forms::get<DispFrm>());
}

void MainFrm::VxiBtn_Click() {
    stop_measurement();
    switch_page(*this, forms::get<VxiFrm>());
}
