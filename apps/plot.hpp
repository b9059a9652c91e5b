// Plots for twa, drawn by gnuplot (Debian package gnuplot-nox): SVG or PNG by the file's extension.
#pragma once

#include <string>
#include <vector>

namespace twa {

struct PlotSpec {
    std::string title, xlabel, ylabel;
    bool lines = true;  // lines, or impulses for sampled values
};

inline constexpr int kPlotWidth = 800, kPlotHeight = 500;

// Draws y against x into FILE.svg or FILE.png. On failure returns false with *error set (one line).
bool Plot(const std::string& file, const PlotSpec& spec, const std::vector<double>& x,
          const std::vector<double>& y, std::string* error);

}  // namespace twa
