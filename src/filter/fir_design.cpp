#include "filter/fir_design.hpp"

#include <algorithm>
#include <cmath>
#include <tuple>
#include <utility>

#include "filter/equiripple.hpp"

namespace tw {

namespace {

constexpr double kPi = 3.14159265358979323846;
constexpr double kTwoPi = 2.0 * kPi;

}  // namespace

Status TruncatedSincDesign(double fs, double fl, double fh, int32_t n, int32_t type, double* h) {
    if (type < 2) fh = (fs * 0.5 + fl) * 0.5;
    if (fl > fs / 2.0 || fh > fs / 2.0) return CutoffAboveNyquistErr;
    if (!(fs > 0.0) || !(fl > 0.0) || (type >= 2 && (!(fh > 0.0) || !(fh > fl)))) return CutoffInvalidErr;
    if ((type == 1 || type == 3) && n % 2 == 0) return EvenTapsErr;
    const double w1 = kTwoPi * fl / fs, w2 = kTwoPi * fh / fs;
    const double half = (n - 1) / 2.0;
    // Arguments and denominators are stepped, both ends filled from one value (the sinc is even).
    double a1 = -w1 * half, a2 = -w2 * half, den = -kPi * half;
    for (int32_t k = 0, j = n - 1; k < j; ++k, --j) {
        double v = 0.0;
        switch (type) {
        case 0: v = std::sin(a1) / den; break;
        case 1: v = -std::sin(a1) / den; break;
        case 2: v = (std::sin(a2) - std::sin(a1)) / den; break;
        default: v = (std::sin(a1) - std::sin(a2)) / den; break;
        }
        h[k] = h[j] = v;
        a1 += w1;
        a2 += w2;
        den += kPi;
    }
    if (n % 2 == 1) {
        const int32_t c = n / 2;
        switch (type) {
        case 0: h[c] = w1 / kPi; break;
        case 1: h[c] = 1.0 - w1 / kPi; break;
        case 2: h[c] = (w2 - w1) / kPi; break;
        default: h[c] = 1.0 - (w2 - w1) / kPi; break;
        }
    }
    return 0;
}

namespace {

// Kaiser's length estimate for a deviation product d and a normalised transition width b.
int32_t KaiserLength(double d, double b) {
    const double v = (-20.0 * std::log10(std::sqrt(d)) - 13.0) / 14.6 / b;
    if (!(v > -2147483647.0)) return -1;
    return v < 2147483647.0 ? static_cast<int32_t>(v) : 2147483647;
}

int32_t Grown(int32_t n) { return n > 100 ? static_cast<int32_t>(n * 1.1) : n; }

// Equiripple stage at fs, lengthened by 5 % until the peak weighted error meets the target; odd
// lengths for every class but the plain lowpass. The taps are left in *taps (scratch).
Status DesignStage(const EquirippleBand* bands, int32_t nBands, double fs, int32_t estimate, int32_t filterClass,
                   double target, double** taps, int32_t* length) {
    for (int32_t b = 0; b < nBands; ++b)
        if (!std::isfinite(bands[b].gain) || !std::isfinite(bands[b].lower) || !std::isfinite(bands[b].upper) ||
            !std::isfinite(bands[b].weight))
            return DesignParameterErr;
    int32_t n = estimate;
    for (;;) {
        if (filterClass != 0 && n % 2 == 0) ++n;
        if (n < 1) return OrderNotPositiveErr;
        void* cell = *taps;
        if (ScratchRealloc(&cell, static_cast<size_t>(n) * sizeof(double)) != 0) return OutOfMemoryErr;
        *taps = static_cast<double*>(cell);
        double dev = 0.0;
        bool ranOut = false;
        if (const Status s = EquirippleDesign(n, fs, bands, nBands, kMultiband, 100, *taps, &dev, &ranOut)) return s;
        *length = n;
        if (!(dev > target)) return 0;
        const double grown = std::ceil(n * 1.05);
        if (!(grown < 2147483647.0)) return OutOfMemoryErr;
        n = static_cast<int32_t>(grown);
    }
}

// Sign alternation about the centre tap, which keeps its sign.
void Alternate(double* h, int32_t n) {
    const int32_t m = (n - 1) / 2;
    for (int32_t k = m % 2 == 1 ? 0 : 1; k < n; k += 2) h[k] = -h[k];
}

void Negate(double* h, int32_t n) {
    for (int32_t k = 0; k < n; ++k) h[k] = -h[k];
}

}  // namespace

Status NarrowbandDesign(double fs, double f1, double f2, double c, double ripple, double attenuation, int32_t type,
                        NarrowbandStages* out) {
    *out = NarrowbandStages{};
    if (type < 0 || type > 3) return DesignParameterErr;
    double ds = std::pow(10.0, -attenuation / 20.0);
    const double half = fs / 2.0;
    int32_t filterClass = type;
    switch (type) {
    case 0:
        if (f1 > fs / 4.0) {
            filterClass = 4;
            std::tie(f1, f2) = std::pair(half - f2, half - f1);
            std::swap(ripple, ds);
        }
        break;
    case 1:
        f1 = half - f1;
        f2 = half - f2;
        if (f1 > fs / 4.0) {
            filterClass = 5;
            std::tie(f1, f2) = std::pair(half - f2, half - f1);
            std::swap(ripple, ds);
        }
        break;
    case 2:
        f1 /= 2.0;
        f2 /= 2.0;
        break;
    default:
        std::tie(f1, f2) = std::pair(f2 / 2.0, f1 / 2.0);
        std::swap(ripple, ds);
        break;
    }
    // An infinite rate leaves no finite design (and the stage search below would not end).
    if (!(f1 > 0.0) || !(f2 > f1) || !(f2 < half) || !(ds > 0.0) || !(ripple > 0.0) || !std::isfinite(half))
        return DesignParameterErr;
    const double target = ripple / 2.0;
    const double w = target / ds;

    int32_t L = 1, M = 0, I = 0, region = 1;
    double r = c, T = 0.0;
    if (type < 2) {
        double l = std::floor(fs / (f1 + f2 + std::sqrt((f2 - f1) * fs)) + 0.5);
        while (l * f2 >= half) l -= 1.0;
        // A wide transition can round the estimate to 0: one stage is then the only choice.
        L = !(l >= 1.0) ? 1 : static_cast<int32_t>(std::min(l, 1e9));
        I = L == 1 ? 0 : KaiserLength(0.5 * ripple * ds, (fs / L - f2 - f1) / fs);
        M = KaiserLength(0.5 * ripple * ds, (L * f2 - L * f1) / fs);
        const int32_t single = KaiserLength(ripple * ds, (f2 - f1) / fs);
        if (int64_t{single} <= int64_t{M} + I) {
            L = 1;
            M = single;
            I = 0;
        }
    } else {
        M = KaiserLength(ripple * ds, (f2 - f1) / fs);
        const double top = std::min(std::trunc(fs / 4.0 / f2), 1e9);
        for (int32_t k = 2; k <= top; ++k) {
            const double x = c * k;
            const double whole = std::floor(x / fs);
            // A centre a billion rates away has no stage that could hold it (nor an i32 region).
            if (!(std::fabs(whole) < 1e9)) continue;
            double rk = x - whole * fs;
            int32_t reg = static_cast<int32_t>(2.0 * whole + 1.0);
            if (rk > half) {
                rk = fs - rk;
                ++reg;
            }
            if (rk + k * f2 >= half || !(rk - k * f2 > 0.0)) continue;
            const int32_t mk = KaiserLength(0.5 * ripple * ds, k * (f2 - f1) / fs);
            const double X = (reg == 1 || (reg == k && k % 2 == 0) || rk > fs / 4.0) ? fs - 2.0 * rk : 2.0 * rk;
            const double tk = X / k - f2 - f1;
            const int32_t ik = KaiserLength(0.5 * ripple * ds, tk / fs);
            if (int64_t{mk} + ik < int64_t{M} + I) {
                L = k;
                M = mk;
                I = ik;
                region = reg;
                r = rk;
                T = tk;
            }
        }
    }
    M = Grown(M);
    I = Grown(I);
    if (M < 0 || I < 0) return DesignParameterErr;

    EquirippleBand bands[3];
    int32_t nb = 0;
    if (type < 2) {
        bands[nb++] = {1.0, 0.0, L * f1, 1.0};
        bands[nb++] = {0.0, L * f2, half, w};
    } else {
        bands[nb++] = {0.0, 0.0, r - L * f2, w};
        bands[nb++] = {1.0, r - L * f1, r + L * f1, 1.0};
        bands[nb++] = {0.0, r + L * f2, half, w};
    }
    Status s = DesignStage(bands, nb, fs, M, filterClass, target, &out->model, &out->nModel);
    if (s == 0 && L > 1) {
        nb = 0;
        if (type < 2) {
            bands[nb++] = {1.0, 0.0, f1, 1.0};
            bands[nb++] = {0.0, fs / L - f2, half, w};
        } else if (region == 1) {
            bands[nb++] = {1.0, 0.0, f1 + c, 1.0};
            bands[nb++] = {0.0, f1 + c + T, half, w};
        } else if (region == L) {
            bands[nb++] = {0.0, 0.0, c - f1 - T, w};
            bands[nb++] = {1.0, c - f1, half, 1.0};
        } else {
            bands[nb++] = {0.0, 0.0, c - f1 - T, w};
            bands[nb++] = {1.0, c - f1, c + f1, 1.0};
            bands[nb++] = {0.0, c + f1 + T, half, w};
        }
        s = DesignStage(bands, nb, fs, I, filterClass, target, &out->image, &out->nImage);
    }
    if (s != 0) {
        ScratchFree(std::exchange(out->model, nullptr));
        ScratchFree(std::exchange(out->image, nullptr));
        out->nModel = out->nImage = 0;
        return s;
    }
    out->filterClass = filterClass;
    out->interpolation = L;
    double* model = out->model;
    double* image = out->image;
    const int32_t nm = out->nModel, ni = out->nImage;
    if (L == 1) {
        if (filterClass == 1 || filterClass == 4) Alternate(model, nm);
        if (filterClass == 3 || filterClass == 4 || filterClass == 5) Negate(model, nm);
    } else {
        if (filterClass == 1 || filterClass == 4) {
            Alternate(image, ni);
            if (L % 2 == 1) Alternate(model, nm);
        }
        if (filterClass == 3 || filterClass == 4 || filterClass == 5) Negate(image, ni);
    }
    return 0;
}

}  // namespace tw
