// The Input Setup page: range, coupling, digital anti-alias filter, input mode and the trigger
// settings of one input channel, or of all of them at once. It works on the module directly:
// every showing reads the values from the driver, OK writes them back.
#pragma once

#include <QCheckBox>
#include <QComboBox>
#include <QLabel>
#include <QLineEdit>
#include <QPushButton>
#include <cstdint>

#include "core/Form.h"

class InputFrm : public Form {
    Q_OBJECT
  public:
    InputFrm();

    // Lays the page out, then reloads every control from the module.
    void Form_Resize() override;
    // Reads the settings of the channel shown (channel 1 in the all-channels mode).
    void load_controls();

    void AllSameChk_Click();
    void doneBtn_Click();
    void cancelBtn_Click();

    QCheckBox* AllSameChk;
    QLabel* ChanNumLbl;
    QComboBox* ChnNumCmbo;
    QLabel* RngLbl;
    QLineEdit* RangeTxt;
    QLabel* couplbl;
    QComboBox* CoupCmbo;
    QLabel* gndlbl;
    QComboBox* GndCmbo;
    QLabel* DAALbl;
    QComboBox* DAACmbo;
    QLabel* AAALbl;
    QComboBox* AAACmbo;
    QLabel* inpmodeLbl;
    QComboBox* inpmodeCmbo;
    QLabel* TrigOnLbl;
    QComboBox* TrigOnCmbo;
    QLabel* TrigModeLbl;
    QComboBox* TrigModeCmbo;
    QLabel* TrigLvlLbl;
    QLineEdit* TrigLvlTxt;
    QLabel* HystLbl;
    QLineEdit* HystTxt;
    QLabel* TrigDirLbl;
    QComboBox* TrigDirCmbo;
    QPushButton* doneBtn;
    QPushButton* cancelBtn;

    // The channel shown when "All Channels Match" is off; the last one confirmed with OK.
    int16_t cur_chan = 1;

  private:
    void Form_Load();
    // Width that shows the widest fixed field text whole, in twips.
    double field_width() const;
};
