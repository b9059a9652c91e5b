#include "plot.hpp"

#include <sys/wait.h>
#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <sstream>

namespace twa {
namespace {

bool OnPath(const char* program) {
    const char* path = std::getenv("PATH");
    std::stringstream dirs(path ? path : "");
    std::string dir;
    while (std::getline(dirs, dir, ':'))
        if (!dir.empty() && access((dir + "/" + program).c_str(), X_OK) == 0) return true;
    return false;
}

// gnuplot reads its strings in single quotes, where only a quote needs doubling.
std::string Quote(const std::string& s) {
    std::string q = "'";
    for (char c : s) q += c == '\'' ? std::string("''") : std::string(1, c);
    return q + "'";
}

}  // namespace

bool Plot(const std::string& file, const PlotSpec& spec, const std::vector<double>& x,
          const std::vector<double>& y, std::string* error) {
    const bool svg = file.size() > 4 && file.compare(file.size() - 4, 4, ".svg") == 0;
    const bool png = file.size() > 4 && file.compare(file.size() - 4, 4, ".png") == 0;
    if (!svg && !png) {
        *error = file + ": --plot writes .svg or .png files";
        return false;
    }
    if (!OnPath("gnuplot")) {
        *error = "--plot needs gnuplot: apt-get install gnuplot-nox";
        return false;
    }
    FILE* g = popen("gnuplot", "w");
    if (g == nullptr) {
        *error = "could not start gnuplot";
        return false;
    }
    std::fprintf(g, "set terminal %s size %d,%d\nset output %s\n", svg ? "svg" : "pngcairo", kPlotWidth,
                 kPlotHeight, Quote(file).c_str());
    std::fprintf(g, "set title %s\nset xlabel %s\nset ylabel %s\nset grid\nunset key\n", Quote(spec.title).c_str(),
                 Quote(spec.xlabel).c_str(), Quote(spec.ylabel).c_str());
    std::fprintf(g, "plot '-' using 1:2 with %s\n", spec.lines ? "lines" : "impulses");
    for (size_t i = 0; i < x.size() && i < y.size(); ++i) std::fprintf(g, "%.17g %.17g\n", x[i], y[i]);
    std::fprintf(g, "e\n");
    const int status = pclose(g);
    if (status != 0) {
        *error = "gnuplot failed to write " + file;
        return false;
    }
    return true;
}

}  // namespace twa
