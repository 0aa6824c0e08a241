// The Display Controls page: which input channel each of the four traces shows, and the file
// each trace is written to.
#pragma once

#include <QComboBox>
#include <QLabel>
#include <QLineEdit>
#include <QPushButton>
#include <array>
#include <string>

#include "core/Form.h"

class DispFrm : public Form {
    Q_OBJECT
  public:
    DispFrm();

    // Lays the controls out and refills them from the confirmed choices, so edits not
    // confirmed with OK are dropped.
    void Form_Resize() override;

    void doneBtn_Click();
    void cancelBtn_Click();

    QLabel* Label2;
    QLabel* Label3;
    QLabel* Label4;
    std::array<QLabel*, 4> Label1{};
    std::array<QComboBox*, 4> TrcChanCmbo{};
    std::array<QLineEdit*, 4> Text1{};
    QPushButton* doneBtn;
    QPushButton* cancelBtn;

    // Last confirmed text of each channel box (index 0..3 used); kept between visits.
    std::array<std::string, 5> trace_choice;

  private:
    void Form_Load();
};
