#include "core/windows.h"

#include <map>
#include <vector>

namespace forms {
namespace {

struct Registry {
    std::map<std::type_index, Form*> by_type;
    std::vector<std::unique_ptr<Form>> owned;  // in creation order
    Form* main = nullptr;
};

Registry& registry() {
    static Registry r;
    return r;
}

}  // namespace

Form* find(std::type_index type) {
    auto it = registry().by_type.find(type);
    return it == registry().by_type.end() ? nullptr : it->second;
}

void add(std::type_index type, std::unique_ptr<Form> form) {
    registry().by_type[type] = form.get();
    registry().owned.push_back(std::move(form));
}

Form& main_form() {
    return *registry().main;
}
void set_main_form(Form* form) {
    registry().main = form;
}

void forget_main_form(const Form* form) {
    if (registry().main == form)
        registry().main = nullptr;
}

void destroy_all() {
    Registry& r = registry();
    r.by_type.clear();
    r.main = nullptr;
    // Newest first, so a page goes before the main window it may refer to.
    while (!r.owned.empty())
        r.owned.pop_back();
}

}  // namespace forms
