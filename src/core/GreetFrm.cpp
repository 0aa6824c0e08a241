#include "core/GreetFrm.h"

#include <QFontMetrics>

#include "core/dialogs.h"

namespace {

QFont sans_serif(double points) {
    QFont f(QStringLiteral("MS Sans Serif"));
    f.setStyleHint(QFont::SansSerif);
    f.setPointSizeF(points);
    return f;
}

}  // namespace

GreetFrm::GreetFrm() : Form(QStringLiteral("Ostrana K7720A Soft Front Panel")) {
    setFont(sans_serif(13.5));
    Text1 = new QLineEdit(this);
    Text1->setFont(sans_serif(24));
    Text1->setReadOnly(true);
    Text1->setFrame(false);
    Text1->setAlignment(Qt::AlignCenter);
}

void GreetFrm::Form_Resize() {
    const QString caption = QStringLiteral("Initializing K7720A VXI Modules");
    Text1->setText(caption);
    // Measured in the box's own 24-point font: measured in the window's smaller font, as the
    // splash was first drawn, the box cut off the start of its own text.
    const QFontMetrics metrics(Text1->font());
    const double tw = metrics.horizontalAdvance(caption) * twips_per_pixel_x();
    const double th = metrics.height() * twips_per_pixel_y();
    twips::set_top(Text1, ScaleHeight() / 2);
    twips::set_width(Text1, tw + 100);
    twips::set_height(Text1, th + 20);
    twips::set_left(Text1, (ScaleWidth() - tw) / 2);
    do_events();
}
