#include <QApplication>

#include "core/windows.h"
#include "display/MainFrm.h"

int main(int argc, char* argv[]) {
    QApplication app(argc, argv);
    QApplication::setApplicationName(QStringLiteral("Ostrana K7720A Soft Front Panel"));
    MainFrm& main_window = forms::get<MainFrm>();
    main_window.Form_Load();
    main_window.show();
    return QApplication::exec();
}
