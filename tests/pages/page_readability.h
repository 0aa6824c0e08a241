// Readability of a laid-out page: every visible control lies inside its parent, no two visible
// siblings overlap, and every caption or text fits its control. Returns one line per fault.
#pragma once

#include <QAbstractButton>
#include <QComboBox>
#include <QGroupBox>
#include <QLabel>
#include <QLineEdit>
#include <QPushButton>
#include <QStyle>
#include <QWidget>
#include <string>
#include <vector>

namespace page_check {

// The text a control shows, and the width it needs to show it whole.
inline std::pair<QString, int> shown_text(const QWidget* w) {
    const QFontMetrics fm(w->font());
    if (auto* l = qobject_cast<const QLabel*>(w))
        return {l->text(), fm.horizontalAdvance(l->text())};
    if (auto* b = qobject_cast<const QAbstractButton*>(w))
        return {b->text(), qobject_cast<const QPushButton*>(w) ? fm.horizontalAdvance(b->text()) + 4
                                                               : b->sizeHint().width()};
    if (auto* e = qobject_cast<const QLineEdit*>(w)) {
        const int frame = e->style()->pixelMetric(QStyle::PM_DefaultFrameWidth, nullptr, e);
        return {e->text(), fm.horizontalAdvance(e->text()) + 2 * 2 + 2 * frame};
    }
    if (auto* g = qobject_cast<const QGroupBox*>(w))
        return {g->title(), fm.horizontalAdvance(g->title())};
    return {};
}

inline std::string describe(const QWidget* w) {
    return std::string(w->metaObject()->className()) + " \"" + shown_text(w).first.toStdString() + "\"";
}

inline void collect(const QWidget* parent, std::vector<std::string>& faults) {
    // The parts a combo box is made of are its own business.
    if (qobject_cast<const QComboBox*>(parent) != nullptr)
        return;
    std::vector<const QWidget*> shown;
    for (const QObject* o : parent->children()) {
        auto* w = qobject_cast<const QWidget*>(o);
        if (w != nullptr && !w->isHidden() && !w->isWindow())
            shown.push_back(w);
    }
    for (const QWidget* w : shown) {
        if (!parent->rect().contains(w->geometry()))
            faults.push_back(describe(w) + " sticks out of " + describe(parent));
        if (const int needed = shown_text(w).second; needed > w->width())
            faults.push_back(describe(w) + " is " + std::to_string(w->width()) + " px wide, needs " +
                             std::to_string(needed));
        if ((qobject_cast<const QLabel*>(w) || qobject_cast<const QAbstractButton*>(w)) &&
            QFontMetrics(w->font()).height() > w->height())
            faults.push_back(describe(w) + " is too low for its text");
        collect(w, faults);
    }
    for (size_t a = 0; a < shown.size(); ++a)
        for (size_t b = a + 1; b < shown.size(); ++b)
            if (shown[a]->geometry().intersects(shown[b]->geometry()))
                faults.push_back(describe(shown[a]) + " overlaps " + describe(shown[b]));
}

inline std::vector<std::string> layout_faults(const QWidget* page) {
    std::vector<std::string> faults;
    collect(page, faults);
    return faults;
}

}  // namespace page_check
