// The Measurement Control page: domain, span, block size, trigger source, data mode, single
// block or repeat, and multi-mainframe arming. It only writes the panel state; the module gets
// the settings at the next set-up.
#pragma once

#include <QCheckBox>
#include <QGroupBox>
#include <QLineEdit>
#include <QPushButton>
#include <QRadioButton>

#include "core/Form.h"

class MeasFrm : public Form {
    Q_OBJECT
  public:
    MeasFrm();

    // Shows the current settings; the main window's Meas button calls it before each visit.
    void load_Meas_Form();
    void Form_Resize() override;

    void doneBtn_Click();
    void cancelBtn_Click();

    QCheckBox* mmcheck;
    QGroupBox* DomFrm;
    QRadioButton* FreqBtn;
    QRadioButton* TimeBtn;
    QGroupBox* SpanFrame;
    QLineEdit* SpanTxt;
    QGroupBox* BlocksizeFrame;
    QLineEdit* BlocksizeTxt;
    QGroupBox* TrigFrame;
    QRadioButton* SourceBtn;
    QRadioButton* InputBtn;
    QRadioButton* ManualBtn;
    QRadioButton* AutoBtn;
    QGroupBox* ModeFrame;
    QRadioButton* ContBtn;
    QRadioButton* BlockBtn;
    QGroupBox* MeasFrame;
    QRadioButton* RepeatBtn;
    QRadioButton* SingleBtn;
    QPushButton* cancelBtn;
    QPushButton* doneBtn;
};
