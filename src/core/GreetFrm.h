// The splash window that stands in the main window's place while the modules are found.
#pragma once

#include <QLineEdit>

#include "core/Form.h"

class GreetFrm : public Form {
    Q_OBJECT
  public:
    GreetFrm();
    void Form_Resize() override;

    QLineEdit* Text1;
};
