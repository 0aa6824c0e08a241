// The main window: the trace display, the run buttons and the page buttons.
#pragma once

#include <QCheckBox>
#include <QLabel>
#include <QLineEdit>
#include <QPushButton>
#include <QTimer>
#include <array>
#include <cstdint>

#include "core/Form.h"
#include "display/PictureBox.h"

class MainFrm : public Form {
    Q_OBJECT
  public:
    MainFrm();
    ~MainFrm() override;

    // The program's entry: sizes the window, sets the defaults, finds the modules, opens the
    // session and draws the (empty) traces.
    void Form_Load();
    void Form_Resize() override;

    void trace_update();
    void hightxt_Change(int16_t Index);
    void lowtxt_Change(int16_t Index);

    // Run control
    void GoBtn_Click();
    void TriggerBtn_Click();
    void MainTimer_Timer();
    void setup_data_wait();
    void stop_measurement();

    // Page buttons
    void MeasBtn_Click();
    void InpBtn_Click();
    void SrcBtn_Click();
    void DispBtn_Click();
    void VxiBtn_Click();

    void ExitBtn_Click();

    QTimer* MainTimer;
    QPushButton* TriggerBtn;
    std::array<QLineEdit*, 4> LowTxt{};
    std::array<QLineEdit*, 4> HighTxt{};
    std::array<PictureBox*, 4> CRTpic{};
    std::array<QLabel*, 4> ChanLbl{};
    QPushButton* VxiBtn;
    QPushButton* GoBtn;
    QPushButton* ExitBtn;
    QPushButton* MeasBtn;
    QPushButton* DispBtn;
    QPushButton* SrcBtn;
    QPushButton* InpBtn;

  protected:
    // Closing the main window ends the program like Exit.
    void closeEvent(QCloseEvent* event) override;

  private:
    // Sets a scale box's text; when the text is already there (no change event), runs the
    // change handler all the same, so the box's value always reaches its slot.
    void fill_scale_box(QLineEdit* box, const QString& text, int16_t position, bool high);
    void scale_box_changed(QLineEdit* box, std::array<double, 5>& limits, int16_t position);

    // The trace slot shown at each display position (a position not in use maps to itself).
    // The scale boxes beside a picture show and set that picture's slot.
    std::array<int, 4> slot_at_{0, 1, 2, 3};
    // The slot whose drawing each picture holds; -1 for none yet.
    std::array<int, 4> drawn_slot_{-1, -1, -1, -1};
    int rewrite_depth_ = 0;
};
