// Layout procedures shared by the setup pages. Lengths are in twips; captions are read from
// the control's text (label, button, check box).
#pragma once

#include <QAbstractButton>
#include <QWidget>
#include <cstdint>

#include "core/Form.h"

// OK at the lower left, Cancel half a button to its right, each one eighth of the window wide.
void place_ok_cancel(Form& form, QWidget* ok, QWidget* cancel);

// Places a control in the page's two-column grid: index 0..7 first column, 8..15 second;
// kind 1 is a label (sized to its caption), 2 a field, 0 the column's left.
void place_in_grid(Form& form, QWidget* control, int16_t index, int16_t kind);

// Sizes an option button to its caption.
void size_option_button(Form& form, QAbstractButton* option);
