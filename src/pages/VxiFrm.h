// The VXI setup page: the modules found at start-up, one row each, and which of them take part
// in the session. OK opens the session again over the chosen modules.
#pragma once

#include <QCheckBox>
#include <QLabel>
#include <QLineEdit>
#include <QPushButton>
#include <cstdint>
#include <vector>

#include "core/Form.h"
#include "pages/resource_list.h"

class VxiFrm : public Form {
    Q_OBJECT
  public:
    VxiFrm();

    // Fills the rows from the module table and lays the page out.
    void Form_Resize() override;

    void UseCkbx_Click(int16_t Index);
    void doneBtn_Click();
    void cancelBtn_Click();

    QLineEdit* revtxt;
    QLineEdit* RNameTxt;
    QPushButton* cancelBtn;
    QPushButton* doneBtn;
    QLabel* revlbl;
    QLabel* VName;
    // Element 0 is the column head (its check box hidden); element i is module i.
    std::vector<QCheckBox*> UseCkbx;
    std::vector<QLabel*> MemLbl;
    std::vector<QLabel*> SrcLbl;
    std::vector<QLabel*> InpLbl;
    std::vector<QLabel*> TachLbl;
    std::vector<QLabel*> LALbl;

  private:
    // Creates the rows of the modules found; the module table does not change after start-up.
    void Form_Load();
};
