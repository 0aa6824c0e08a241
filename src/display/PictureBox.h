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
#include <QLineF>
#include <QPointF>
#include <QWidget>
#include <cstdint>
#include <vector>

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

    // Several lines in one colour, each drawn as line() draws it; the last end becomes the
    // current position.
    void lines(const QLineF* list, int n, const QColor& color);

    // line_to through every point in order, in one pass over the image: the same pixels as n
    // line_to calls, at a fraction of the cost when many points share a pixel column.
    void polyline_to(const QPointF* points, int n);

    // line_to through (xs[k], y_k) for k = 0 .. n - 1, where y_k is ys[k] raised to low and
    // then lowered to high: the same pixels as those n calls. Samples that stay in one pixel
    // column cost two comparisons each, which is what makes a long block cheap to draw.
    void trace_to(const float* xs, const double* ys, int n, double low, double high);

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
    // The pixels and the integer rasteriser, for one drawing call.
    struct Canvas;
    Canvas canvas();

    QImage image_;
    double sx1_ = 0, sy1_ = 0, sx2_ = 1, sy2_ = 1;
    bool scale_ok_ = true;
    double cur_x_ = 0, cur_y_ = 0;
    // Scratch of trace_to: where each pixel column begins along x for the scale of one call.
    std::vector<double> column_edges_;
};
