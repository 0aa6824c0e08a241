// A picture area: a persistent image that the widget paints, a user coordinate system set by
// two corners (y may grow upward), clearing, and lines in user coordinates.
//
// The image has one pixel per device pixel (twice the widget's size in each direction on a
// 2x screen), and lines are one device pixel wide, drawn without antialiasing by one
// integer rasteriser, so that the same lines always give the same pixels however they are
// issued. A user point maps to the device pixel that contains it; the right and bottom
// edges of the picture belong to its last column and row.
#pragma once

#include <QColor>
#include <QImage>
#include <QPointF>
#include <QWidget>
#include <cstdint>

class PictureBox : public QWidget {
    Q_OBJECT
  public:
    explicit PictureBox(QWidget* parent = nullptr);

    // User scale: (x1, y1) is the upper-left corner, (x2, y2) the lower-right one. A scale
    // with a zero or non-finite span is kept but draws nothing (see scale_valid).
    void set_scale(double x1, double y1, double x2, double y2);
    bool scale_valid() const { return scale_ok_; }

    // Clears the image to the background colour.
    void clear();

    // A line between two points in user coordinates; the end becomes the current position.
    void line(double x1, double y1, double x2, double y2, const QColor& color);
    // A line from the current position in the foreground colour.
    void line_to(double x, double y);
    void set_current(double x, double y);

    // line_to through every point in order, in one pass over the image: the same pixels as n
    // line_to calls, at a fraction of the cost when many points share a pixel column.
    void polyline_to(const QPointF* points, int n);

    QColor background() const;
    QColor foreground() const;

    // Device pixel offset of a user point from the picture's left and top edges.
    double device_x(double x) const;
    double device_y(double y) const;

    // The image at device pixels (its devicePixelRatio says how many per widget unit).
    const QImage& image() const { return image_; }

  protected:
    void paintEvent(QPaintEvent* event) override;
    void resizeEvent(QResizeEvent* event) override;

  private:
    void ensure_image();
    // Integer line between two device pixels, both ends included.
    void segment(int32_t ax, int32_t ay, int32_t bx, int32_t by, QRgb color);
    void column_run(int32_t x, int32_t y0, int32_t y1, QRgb color);

    QImage image_;
    double sx1_ = 0, sy1_ = 0, sx2_ = 1, sy2_ = 1;
    bool scale_ok_ = true;
    double cur_x_ = 0, cur_y_ = 0;
};
