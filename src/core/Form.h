// Base of every window: a top-level widget whose geometry is read and set in twips
// (1/1440 inch), the unit of all layout constants. A twip value is rounded to whole pixels
// when set and read back as pixels times twips per pixel.
#pragma once

#include <QString>
#include <QWidget>

class Form : public QWidget {
    Q_OBJECT
  public:
    explicit Form(const QString& caption);

    // Outer frame, in twips.
    double Top() const;
    double Left() const;
    double Width() const;
    double Height() const;
    void setTop(double twips);
    void setLeft(double twips);
    void setWidth(double twips);
    void setHeight(double twips);

    // Inner area, in twips.
    double ScaleWidth() const;
    double ScaleHeight() const;

    // Size of a text in the window's own font, in twips.
    double TextWidth(const QString& text) const;
    double TextHeight(const QString& text) const;

    double twips_per_pixel_x() const;
    double twips_per_pixel_y() const;

    // Lays the controls out for the current size.
    virtual void Form_Resize() {}

    // Runs Form_Resize once; size changes made while it runs (or while layout is held) do
    // not run it again. The resize event and switch_page come through here.
    void run_resize();
    void hold_layout(bool hold) { layout_held_ = hold; }

  protected:
    void resizeEvent(QResizeEvent* event) override;

  private:
    bool in_resize_ = false;
    bool layout_held_ = false;
};

// Control geometry in twips, relative to the control's parent, using the form's scale.
namespace twips {
double left(const QWidget* control);
double top(const QWidget* control);
double width(const QWidget* control);
double height(const QWidget* control);
void set_left(QWidget* control, double value);
void set_top(QWidget* control, double value);
void set_width(QWidget* control, double value);
void set_height(QWidget* control, double value);
}  // namespace twips

// One window takes over another's place: position and size, shown, laid out, enabled; the
// source is hidden and disabled.
void switch_page(Form& source, Form& target);
