#include "display/page_layout.h"

#include <QVariant>

namespace {

// The caption of a label, button or check box.
QString caption(const QWidget* control) {
    return control->property("text").toString();
}

}  // namespace

void place_ok_cancel(Form& form, QWidget* ok, QWidget* cancel) {
    twips::set_width(ok, form.Width() / 8);
    twips::set_height(ok, form.Height() / 15);
    twips::set_width(cancel, twips::width(ok));
    twips::set_height(cancel, twips::height(ok));
    twips::set_left(ok, twips::width(ok) / 2);
    twips::set_top(ok, form.Height() - 1.5 * twips::height(ok) - 400);
    twips::set_left(cancel, twips::left(ok) + 1.5 * twips::width(ok));
    twips::set_top(cancel, twips::top(ok));
}

void place_in_grid(Form& form, QWidget* control, int16_t index, int16_t kind) {
    const double ru = form.ScaleHeight() / 18;
    const double top = ru + 2 * ru * (index % 8);  // % keeps the sign of index
    const double cu = form.ScaleWidth() / 12;
    double left = cu / 2;
    if (index >= 8)
        left += 5 * cu;
    switch (kind) {
        case 0:
            left += cu;
            break;
        case 1:
            twips::set_width(control, form.TextWidth(caption(control)) + 5);
            twips::set_height(control, 300);
            break;
        case 2:
            left += 1.5 * cu;
            break;
        default:
            break;
    }
    twips::set_top(control, top);
    twips::set_left(control, left);
}

void size_option_button(Form& form, QAbstractButton* option) {
    twips::set_width(option, form.TextWidth(option->text()) + 300);
    twips::set_height(option, form.TextHeight(option->text()));
}
