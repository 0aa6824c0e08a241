#include "core/Form.h"

#include <QFontMetrics>
#include <QResizeEvent>
#include <QScreen>
#include <cmath>

namespace {

double dpi_x(const QWidget* w) {
    return w->logicalDpiX() > 0 ? w->logicalDpiX() : 96.0;
}
double dpi_y(const QWidget* w) {
    return w->logicalDpiY() > 0 ? w->logicalDpiY() : 96.0;
}
double tpp_x(const QWidget* w) {
    return 1440.0 / dpi_x(w);
}
double tpp_y(const QWidget* w) {
    return 1440.0 / dpi_y(w);
}

// Twips to whole pixels, saturating so that no twip value can overflow a pixel coordinate.
int to_pixels(double value, double tpp) {
    double px = std::nearbyint(value / tpp);
    if (!(px > -1e7))
        return -10000000;  // also catches NaN
    if (px > 1e7)
        return 10000000;
    return static_cast<int>(px);
}

int frame_extra_width(const QWidget* w) {
    return w->frameGeometry().width() - w->geometry().width();
}
int frame_extra_height(const QWidget* w) {
    return w->frameGeometry().height() - w->geometry().height();
}

}  // namespace

Form::Form(const QString& caption) : QWidget(nullptr) {
    setWindowTitle(caption);
}

double Form::twips_per_pixel_x() const {
    return tpp_x(this);
}
double Form::twips_per_pixel_y() const {
    return tpp_y(this);
}

double Form::Top() const {
    return frameGeometry().y() * tpp_y(this);
}
double Form::Left() const {
    return frameGeometry().x() * tpp_x(this);
}
double Form::Width() const {
    return frameGeometry().width() * tpp_x(this);
}
double Form::Height() const {
    return frameGeometry().height() * tpp_y(this);
}

void Form::setTop(double value) {
    move(frameGeometry().x(), to_pixels(value, tpp_y(this)));
}
void Form::setLeft(double value) {
    move(to_pixels(value, tpp_x(this)), frameGeometry().y());
}

void Form::setWidth(double value) {
    int inner = to_pixels(value, tpp_x(this)) - frame_extra_width(this);
    resize(std::max(inner, 1), height());
}

void Form::setHeight(double value) {
    int inner = to_pixels(value, tpp_y(this)) - frame_extra_height(this);
    resize(width(), std::max(inner, 1));
}

double Form::ScaleWidth() const {
    return width() * tpp_x(this);
}
double Form::ScaleHeight() const {
    return height() * tpp_y(this);
}

double Form::TextWidth(const QString& text) const {
    return QFontMetrics(font()).horizontalAdvance(text) * tpp_x(this);
}

double Form::TextHeight(const QString& text) const {
    // Height of a line, whatever the characters, like the classic toolkit.
    QFontMetrics fm(font());
    int lines = 1 + static_cast<int>(text.count(QLatin1Char('\n')));
    return fm.height() * lines * tpp_y(this);
}

void Form::resizeEvent(QResizeEvent* event) {
    QWidget::resizeEvent(event);
    if (!layout_held_)
        run_resize();
}

void Form::run_resize() {
    // A resize handler that changes the size (the minimum-size rule) must not recurse.
    if (in_resize_)
        return;
    in_resize_ = true;
    Form_Resize();
    in_resize_ = false;
}

namespace twips {

double left(const QWidget* c) {
    return c->x() * tpp_x(c);
}
double top(const QWidget* c) {
    return c->y() * tpp_y(c);
}
double width(const QWidget* c) {
    return c->width() * tpp_x(c);
}
double height(const QWidget* c) {
    return c->height() * tpp_y(c);
}
void set_left(QWidget* c, double v) {
    c->move(to_pixels(v, tpp_x(c)), c->y());
}
void set_top(QWidget* c, double v) {
    c->move(c->x(), to_pixels(v, tpp_y(c)));
}
void set_width(QWidget* c, double v) {
    c->resize(std::max(0, to_pixels(v, tpp_x(c))), c->height());
}
void set_height(QWidget* c, double v) {
    c->resize(c->width(), std::max(0, to_pixels(v, tpp_y(c))));
}

}  // namespace twips

void switch_page(Form& source, Form& target) {
    // The target is laid out exactly once, by the explicit call below, not by the resize and
    // show events that the geometry changes raise on the way.
    target.hold_layout(true);
    target.setTop(source.Top());
    target.setLeft(source.Left());
    target.setHeight(source.Height());
    target.setWidth(source.Width());
    target.setVisible(true);
    // A window shown for the first time only now knows its frame: place it again so that its
    // outer size is the one handed over.
    target.setTop(source.Top());
    target.setLeft(source.Left());
    target.setHeight(source.Height());
    target.setWidth(source.Width());
    target.hold_layout(false);
    target.run_resize();
    target.setEnabled(true);
    source.setVisible(false);
    source.setEnabled(false);
}
