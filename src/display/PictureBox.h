// A picture area: a persistent image that the widget paints, a user coordinate system set by
// two corners (y may grow upward), clearing, and lines in user coordinates.
#pragma once

#include <QColor>
#include <QImage>
#include <QWidget>

class PictureBox : public QWidget {
    Q_OBJECT
public:
    explicit PictureBox(QWidget* parent = nullptr);

    // User scale: (x1, y1) is the upper-left corner, (x2, y2) the lower-right one.
    void set_scale(double x1, double y1, double x2, double y2);

    // Clears the image to the background colour.
    void clear();

    // A line between two points in user coordinates; the end becomes the current position.
    void line(double x1, double y1, double x2, double y2, const QColor& color);
    // A line from the current position in the foreground colour.
    void line_to(double x, double y);
    void set_current(double x, double y);

    QColor background() const;
    QColor foreground() const;

    // Device pixel coordinates of a user point (the mapping every drawing call uses).
    double device_x(double x) const;
    double device_y(double y) const;

    const QImage& image() const { return image_; }

protected:
    void paintEvent(QPaintEvent* event) override;
    void resizeEvent(QResizeEvent* event) override;

private:
    void ensure_image();

    QImage image_;
    double sx1_ = 0, sy1_ = 0, sx2_ = 1, sy2_ = 1;
    double cur_x_ = 0, cur_y_ = 0;
};
