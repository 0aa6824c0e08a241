#include "display/PictureBox.h"

#include <QPainter>
#include <QPalette>

PictureBox::PictureBox(QWidget* parent) : QWidget(parent) {}

void PictureBox::set_scale(double x1, double y1, double x2, double y2) {
    sx1_ = x1;
    sy1_ = y1;
    sx2_ = x2;
    sy2_ = y2;
}

QColor PictureBox::background() const { return palette().color(QPalette::Base); }
QColor PictureBox::foreground() const { return palette().color(QPalette::Text); }

void PictureBox::ensure_image() {
    if (image_.size() != size()) {
        image_ = QImage(size().expandedTo(QSize(1, 1)), QImage::Format_RGB32);
        image_.fill(background());
    }
}

void PictureBox::clear() {
    ensure_image();
    image_.fill(background());
    update();
}

double PictureBox::device_x(double x) const { return (x - sx1_) / (sx2_ - sx1_) * width(); }
double PictureBox::device_y(double y) const { return (y - sy1_) / (sy2_ - sy1_) * height(); }

void PictureBox::line(double x1, double y1, double x2, double y2, const QColor& color) {
    ensure_image();
    QPainter p(&image_);
    p.setPen(color);
    p.drawLine(QPointF(device_x(x1), device_y(y1)), QPointF(device_x(x2), device_y(y2)));
    cur_x_ = x2;
    cur_y_ = y2;
    update();
}

void PictureBox::line_to(double x, double y) { line(cur_x_, cur_y_, x, y, foreground()); }

void PictureBox::set_current(double x, double y) {
    cur_x_ = x;
    cur_y_ = y;
}

void PictureBox::paintEvent(QPaintEvent*) {
    QPainter p(this);
    if (image_.isNull()) {
        p.fillRect(rect(), background());
        return;
    }
    p.drawImage(0, 0, image_);
}

void PictureBox::resizeEvent(QResizeEvent* event) {
    QWidget::resizeEvent(event);
    ensure_image();
}
