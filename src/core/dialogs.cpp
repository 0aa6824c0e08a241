#include "core/dialogs.h"

#include <QApplication>
#include <QMessageBox>
#include <cstdio>
#include <cstdlib>

namespace dialogs {
namespace {

Responder& responder() {
    static Responder r;
    return r;
}

// Messages break lines with CR LF; the box wants plain line feeds.
QString to_q(const std::string& s) {
    return QString::fromStdString(s).replace(QStringLiteral("\r\n"), QStringLiteral("\n"));
}

}  // namespace

void set_responder(Responder r) {
    responder() = std::move(r);
}
void clear_responder() {
    responder() = nullptr;
}

void notice(const std::string& text) {
    if (responder()) {
        responder()(Kind::notice, text);
        return;
    }
    QMessageBox box(QMessageBox::NoIcon, QString::fromUtf8(app_title), to_q(text), QMessageBox::Ok);
    box.exec();
}

bool ask_yes_no(const std::string& text) {
    if (responder())
        return responder()(Kind::question, text) == Answer::yes;
    QMessageBox box(QMessageBox::Critical, QString::fromUtf8(app_title), to_q(text),
                    QMessageBox::Yes | QMessageBox::No);
    return box.exec() == QMessageBox::Yes;
}

}  // namespace dialogs

void end_program() {
    std::fflush(nullptr);
    std::_Exit(0);
}

void do_events() {
    QCoreApplication::processEvents();
}
