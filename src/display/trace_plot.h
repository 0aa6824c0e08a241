// Drawing one block of samples into a picture area, with its grid.
#pragma once

#include <cstdint>
#include <span>

#include "display/PictureBox.h"

// Keeps value inside [low, high]: first raised to low, then lowered to high.
double clamp_value(double value, double low, double high);

// Draws n samples (xs[k], ys[k]) into picture: a user scale from x1 - 1 % of w to x1 + 101 % of
// w across and from y1 + 1 % of h down to y1 - 101 % of h, cleared, 8 horizontal and 10
// vertical grey grid lines, then the polyline from the first sample with every sample clamped
// into the visible range. A scale that is empty or not finite leaves the picture cleared with
// nothing drawn.
void plot_trace(PictureBox& picture, double x1, double y1, double w, double h, const float* xs,
                const double* ys, int32_t n);

// The same, drawing no more samples than both arrays hold.
void plot_trace(PictureBox& picture, double x1, double y1, double w, double h, std::span<const float> xs,
                std::span<const double> ys, int32_t n);
