// One instance of each window, created on first use and kept for the whole run.
#pragma once

#include <memory>
#include <typeindex>

#include "core/Form.h"

namespace forms {

Form* find(std::type_index type);
void add(std::type_index type, std::unique_ptr<Form> form);

template <class F>
F& get() {
    if (Form* f = find(typeid(F)))
        return static_cast<F&>(*f);
    auto owned = std::make_unique<F>();
    F& ref = *owned;
    add(typeid(F), std::move(owned));
    return ref;
}

// The main window, for procedures outside the display layer (start-up, page switch).
Form& main_form();
void set_main_form(Form* form);
// A main window going away stops being the main window (if it still is).
void forget_main_form(const Form* form);

// Destroys every window (tests).
void destroy_all();

}  // namespace forms
