// The Source Setup page: one source channel at a time, read from the module at every layout and
// written back by setupsource on OK and Apply.
#pragma once

#include <QComboBox>
#include <QLabel>
#include <QLineEdit>
#include <QPushButton>
#include <QTextEdit>
#include <cstdint>

#include "core/Form.h"

class SrcFrm : public Form {
    Q_OBJECT
  public:
    SrcFrm();
    ~SrcFrm() override;

    // Places the controls, then reloads them from the module: edits not applied are dropped.
    void Form_Resize() override;

    // Fills the controls from the module for the source cur_src (kept within 1..num_sources).
    void load_controls();
    // Takes the source number from SrcWhoCmbo and loads that source when it is another one.
    void checkwho();
    // Writes the page's settings to the module (source_programming.cpp).
    void setupsource();

    void SrcWhoCmbo_Change();
    void SrcWhoCmbo_Click();
    void SrcWhoCmbo_LostFocus();
    void PresetBtn_Click();
    void ApplyBtn_Click();
    void doneBtn_Click();
    void cancelBtn_Click();

    // Number of the source shown, from 1; 0 when the session has no source.
    int16_t cur_src = 0;

    QLabel* ChanNumLbl;
    QComboBox* SrcWhoCmbo;
    QLabel* ActiveLbl;
    QComboBox* ActiveCmbo;
    QLabel* ModeLbl;
    QComboBox* ModeCmbo;
    QLabel* RampLbl;
    QLineEdit* RampRateTxt;
    QLabel* FreqLbl;
    QLineEdit* FreqTxt;
    QLabel* PhaseLbl;
    QLineEdit* PhaseTxt;
    QLabel* OutputLbl;
    QComboBox* OutputCmbo;
    QLabel* SrcTrigLbl;
    QComboBox* SrcTrigCmbo;
    QPushButton* PresetBtn;
    QPushButton* ApplyBtn;
    QLabel* ColaLbl;
    QComboBox* ColaCmbo;
    QLabel* DutyLbl;
    QLineEdit* DutyTxt;
    QLabel* SumLbl;
    QComboBox* SumCmbo;
    QLabel* SeedLbl;
    QLineEdit* SeedTxt;
    QLabel* RangeLbl;
    QLineEdit* RangeTxt;
    QTextEdit* NoteTxt;
    QPushButton* doneBtn;
    QPushButton* cancelBtn;

  protected:
    bool eventFilter(QObject* watched, QEvent* event) override;

  private:
    void Form_Load();
    // Sizes the fields, buttons and hint box; the grid gives only their places.
    void size_controls();

    // Setting SrcWhoCmbo's text from checkwho or load_controls fires its change signal again.
    bool choosing_source_ = false;
};
