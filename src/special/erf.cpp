#include <cmath>

#include "special/gamma.hpp"
#include "special/special_frame.hpp"

namespace tw {

namespace {

// after Cephes `erf`: x T(x^2) / U(x^2) on |x| <= 1, U monic
constexpr double kErfT[5] = {
    9.60497373987051638749E0, 9.00260197203842689217E1, 2.23200534594684319226E3,
    7.00332514112805075473E3, 5.55923013010394962768E4,
};
constexpr double kErfU[5] = {
    3.35617141647503099647E1, 5.21357949780152679795E2, 4.59432382970980127987E3,
    2.26290000613890934246E4, 4.92673942608635921086E4,
};

// after Cephes `erfc`: exp(-x^2) P(|x|) / Q(|x|) on [1, 8), exp(-x^2) R(|x|) / S(|x|) beyond; Q, S monic
constexpr double kErfcP[9] = {
    2.46196981473530512524E-10, 5.64189564831068821977E-1, 7.46321056442269912687E0,
    4.86371970985681366614E1,   1.96520832956077098242E2,  5.26445194995477358631E2,
    9.34528527171957607540E2,   1.02755188689515710272E3,  5.57535335369399327526E2,
};
constexpr double kErfcQ[8] = {
    1.32281951154744992508E1, 8.67072140885989742329E1, 3.54937778887819891062E2, 9.75708501743205489753E2,
    1.82390916687909736289E3, 2.24633760818710981792E3, 1.65666309194161350182E3, 5.57535340817727675546E2,
};
constexpr double kErfcR[6] = {
    5.64189583547755073984E-1, 1.27536670759978104416E0, 5.01905042251180477414E0,
    6.16021097993053585195E0,  7.40974269950448939160E0, 2.97886665372100240670E0,
};
constexpr double kErfcS[6] = {
    2.26052863220117276590E0, 9.39603524938001434673E0, 1.20489539808096656605E1,
    1.70814450747565897222E1, 9.60896809063285878198E0, 3.36907645100081516050E0,
};

}  // namespace

double ErfFunc(double x) {
    double r;
    if (Screened(x, 1.0, -1.0, &r)) return r;
    if (std::fabs(x) > 1.0) return 1.0 - ErfcFunc(x);
    const double z = x * x;
    return x * EvalPoly(z, kErfT, 4) / EvalPolyMonic(z, kErfU, 5);
}

double ErfcFunc(double x) {
    double r;
    if (Screened(x, 0.0, 2.0, &r)) return r;
    const double a = std::fabs(x);
    if (a < 1.0) return 1.0 - ErfFunc(x);
    const double e = -x * x;
    if (e < -kMaxLog) {
        SpecialReport(SpecialFunction::Erfc, SpecialFault::Underflow);
        return x > 0.0 ? 0.0 : 2.0;
    }
    const double z = std::exp(e);
    const double y = a < 8.0 ? z * EvalPoly(a, kErfcP, 8) / EvalPolyMonic(a, kErfcQ, 8)
                             : z * EvalPoly(a, kErfcR, 5) / EvalPolyMonic(a, kErfcS, 6);
    return x < 0.0 ? 2.0 - y : y;
}

}  // namespace tw
