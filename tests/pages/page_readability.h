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

inline std::string describe(const QWidget* w) {
    QString text;
    if (auto* l = qobject_cast<const QLabel*>(w))
        text = l->text();
    if (auto* b = qobject_cast<const QAbstractButton*>(w))
        text = b->text();
    if (auto* e = qobject_cast<const QLineEdit*>(w))
        text = e->text();
    if (auto* g = qobject_cast<const QGroupBox*>(w))
        text = g->title();
    return std::string(w->metaObject()->className()) + " \"" + text.toStdString() + "\"";
}

// Width a control needs to show its text whole.
inline int needed_width(const QWidget* w) {
    const QFontMetrics fm(w->font());
    if (auto* l = qobject_cast<const QLabel*>(w))
        return fm.horizontalAdvance(l->text());
    if (qobject_cast<const QPushButton*>(w)) {
        return fm.horizontalAdvance(static_cast<const QAbstractButton*>(w)->text()) + 4;
    }
    if (auto* b = qobject_cast<const QAbstractButton*>(w))
        return b->sizeHint().width();
    if (auto* e = qobject_cast<const QLineEdit*>(w)) {
        const int frame = e->style()->pixelMetric(QStyle::PM_DefaultFrameWidth, nullptr, e);
        return fm.horizontalAdvance(e->text()) + 2 * 2 + 2 * frame;
    }
    if (auto* g = qobject_cast<const QGroupBox*>(w))
        return fm.horizontalAdvance(g->title());
    return 0;
}

inline void collect(const QWidget* parent, std::vector<std::string>& faults) {
    std::vector<const QWidget*> shown;
    for (const QObject* o : parent->children()) {
        auto* w = qobject_cast<const QWidget*>(o);
        if (w == nullptr || w->isHidden() || w->isWindow())
            continue;
        // The parts a combo box or line edit is made of are its own business.
        if (qobject_cast<const QComboBox*>(parent) != nullptr)
            continue;
        shown.push_back(w);
    }
    for (const QWidget* w : shown) {
        if (!parent->rect().contains(w->geometry()))
            faults.push_back(describe(w) + " sticks out of " + describe(parent));
        if (needed_width(w) > w->width())
            faults.push_back(describe(w) + " is " + std::to_string(w->width()) + " px wide, needs " +
                             std::to_string(needed_width(w)));
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
