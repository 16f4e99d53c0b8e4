#include "filter_design.h"

#include <algorithm>
#include <cmath>
#include <numbers>
#include <stdexcept>

namespace SlmLibrary {

Complex Sos::response(double f, double fs) const {
    const Complex z1 = std::polar(1.0, -2.0 * std::numbers::pi * f / fs);  // z^-1
    const Complex z2 = z1 * z1;
    return (b0 + b1 * z1 + b2 * z2) / (1.0 + a1 * z1 + a2 * z2);
}

double Sos::poleRadius() const {
    // Roots of z^2 + a1 z + a2.
    const double disc = a1 * a1 - 4.0 * a2;
    if (disc < 0.0) return std::sqrt(a2);
    const double r = std::sqrt(disc);
    return std::max(std::abs((-a1 + r) / 2.0), std::abs((-a1 - r) / 2.0));
}

namespace design {
namespace {

constexpr double kPi = std::numbers::pi;
constexpr double kImagTolerance = 1e-12;

bool isReal(const Complex& c) {
    return std::abs(c.imag()) <= kImagTolerance * std::max(1.0, std::abs(c));
}

// prod(-x) over a root list, for the gain bookkeeping of the transforms.
Complex productOfNegated(const std::vector<Complex>& roots) {
    Complex p = 1.0;
    for (const Complex& r : roots) p *= -r;
    return p;
}

// Splits roots into conjugate pairs (one representative with positive imaginary part) and
// real roots.
void splitRoots(const std::vector<Complex>& roots, std::vector<Complex>& pairs,
                std::vector<double>& reals) {
    for (const Complex& r : roots) {
        if (isReal(r)) {
            reals.push_back(r.real());
        } else if (r.imag() > 0.0) {
            pairs.push_back(r);
        }
    }
}

struct Quadratic {  // 1 + c1 x^-1 + c2 x^-2, from its roots
    double c1 = 0.0;
    double c2 = 0.0;
};

Quadratic fromPair(const Complex& r) { return {-2.0 * r.real(), std::norm(r)}; }
Quadratic fromReals(double r1, double r2) { return {-(r1 + r2), r1 * r2}; }
Quadratic fromReal(double r) { return {-r, 0.0}; }

}  // namespace

Zpk butterworthPrototype(int order) {
    if (order < 1) throw std::invalid_argument("filter order must be at least 1");
    Zpk p;
    for (int k = 1; k <= order; ++k) {
        const double theta = kPi * (2.0 * k + order - 1.0) / (2.0 * order);
        p.poles.push_back(std::polar(1.0, theta));
    }
    p.gain = 1.0;
    return p;
}

Zpk chebyshev2Prototype(int order, double stopbandDb) {
    if (order < 1) throw std::invalid_argument("filter order must be at least 1");
    const double eps = 1.0 / std::sqrt(std::pow(10.0, stopbandDb / 10.0) - 1.0);
    const double mu = std::asinh(1.0 / eps) / order;
    Zpk p;
    for (int k = 1; k <= order; ++k) {
        const double theta = kPi * (2.0 * k - 1.0) / (2.0 * order);
        const Complex q(-std::sinh(mu) * std::sin(theta), std::cosh(mu) * std::cos(theta));
        p.poles.push_back(1.0 / q);
        const double c = std::cos(theta);
        if (std::abs(c) > 1e-12) p.zeros.emplace_back(0.0, 1.0 / c);
    }
    p.gain = (productOfNegated(p.poles) / productOfNegated(p.zeros)).real();
    return p;
}

Zpk lowpassToLowpass(const Zpk& proto, double w) {
    Zpk out;
    for (const Complex& z : proto.zeros) out.zeros.push_back(z * w);
    for (const Complex& p : proto.poles) out.poles.push_back(p * w);
    const int degree = static_cast<int>(proto.poles.size() - proto.zeros.size());
    out.gain = proto.gain * std::pow(w, degree);
    return out;
}

Zpk lowpassToHighpass(const Zpk& proto, double w) {
    Zpk out;
    for (const Complex& z : proto.zeros) out.zeros.push_back(w / z);
    for (const Complex& p : proto.poles) out.poles.push_back(w / p);
    out.zeros.resize(out.poles.size(), Complex(0.0, 0.0));
    out.gain = proto.gain * (productOfNegated(proto.zeros) / productOfNegated(proto.poles)).real();
    return out;
}

Zpk lowpassToBandpass(const Zpk& proto, double w0, double bw) {
    Zpk out;
    auto transform = [&](const Complex& x, std::vector<Complex>& into) {
        const Complex half = x * bw / 2.0;
        const Complex root = std::sqrt(half * half - w0 * w0);
        into.push_back(half + root);
        into.push_back(half - root);
    };
    for (const Complex& z : proto.zeros) transform(z, out.zeros);
    for (const Complex& p : proto.poles) transform(p, out.poles);
    const std::size_t degree = proto.poles.size() - proto.zeros.size();
    for (std::size_t i = 0; i < degree; ++i) out.zeros.emplace_back(0.0, 0.0);
    out.gain = proto.gain * std::pow(bw, static_cast<double>(degree));
    return out;
}

Zpk lowpassToBandstop(const Zpk& proto, double w0, double bw) {
    Zpk out;
    auto transform = [&](const Complex& x, std::vector<Complex>& into) {
        const Complex half = bw / (2.0 * x);
        const Complex root = std::sqrt(half * half - w0 * w0);
        into.push_back(half + root);
        into.push_back(half - root);
    };
    for (const Complex& z : proto.zeros) transform(z, out.zeros);
    for (const Complex& p : proto.poles) transform(p, out.poles);
    const std::size_t degree = proto.poles.size() - proto.zeros.size();
    for (std::size_t i = 0; i < degree; ++i) {
        out.zeros.emplace_back(0.0, w0);
        out.zeros.emplace_back(0.0, -w0);
    }
    out.gain = proto.gain * (productOfNegated(proto.zeros) / productOfNegated(proto.poles)).real();
    return out;
}

double prewarp(double f, double fs) { return 2.0 * fs * std::tan(kPi * f / fs); }

Zpk bilinear(const Zpk& analog, double fs) {
    const double k = 2.0 * fs;
    Zpk out;
    Complex num = 1.0;
    Complex den = 1.0;
    for (const Complex& z : analog.zeros) {
        out.zeros.push_back((k + z) / (k - z));
        num *= k - z;
    }
    for (const Complex& p : analog.poles) {
        out.poles.push_back((k + p) / (k - p));
        den *= k - p;
    }
    out.zeros.resize(std::max(out.zeros.size(), out.poles.size()), Complex(-1.0, 0.0));
    out.gain = analog.gain * (num / den).real();
    return out;
}

SosList toSos(const Zpk& digital, double fRef, double fs, double gainAtRef) {
    std::vector<Complex> polePairs;
    std::vector<double> poleReals;
    splitRoots(digital.poles, polePairs, poleReals);
    std::vector<Complex> zeroPairs;
    std::vector<double> zeroReals;
    splitRoots(digital.zeros, zeroPairs, zeroReals);

    // Denominators, most damped first.
    std::vector<Quadratic> dens;
    std::sort(polePairs.begin(), polePairs.end(),
              [](const Complex& a, const Complex& b) { return std::abs(a) < std::abs(b); });
    std::sort(poleReals.begin(), poleReals.end(),
              [](double a, double b) { return std::abs(a) < std::abs(b); });
    std::vector<Complex> denRoots;  // representative pole of each denominator, for zero matching
    for (const Complex& p : polePairs) {
        dens.push_back(fromPair(p));
        denRoots.push_back(p);
    }
    for (std::size_t i = 0; i < poleReals.size(); i += 2) {
        if (i + 1 < poleReals.size()) {
            dens.push_back(fromReals(poleReals[i], poleReals[i + 1]));
        } else {
            dens.push_back(fromReal(poleReals[i]));
        }
        denRoots.emplace_back(poleReals[i], 0.0);
    }

    // Numerators: complex pairs go to the denominator whose pole is nearest; real zeros are
    // paired largest with smallest.
    std::vector<Quadratic> nums;
    std::sort(zeroReals.begin(), zeroReals.end());
    std::size_t lo = 0;
    std::size_t hi = zeroReals.size();
    while (hi - lo >= 2) nums.push_back(fromReals(zeroReals[lo++], zeroReals[--hi]));
    if (hi - lo == 1) nums.push_back(fromReal(zeroReals[lo]));

    const std::size_t count = std::max(dens.size(), zeroPairs.size() + nums.size());
    dens.resize(count);
    denRoots.resize(count, Complex(0.0, 0.0));
    std::vector<Quadratic> assigned(count);
    std::vector<bool> taken(count, false);
    for (const Complex& z : zeroPairs) {
        std::size_t best = count;
        for (std::size_t i = 0; i < count; ++i) {
            if (taken[i]) continue;
            if (best == count || std::abs(denRoots[i] - z) < std::abs(denRoots[best] - z)) best = i;
        }
        assigned[best] = fromPair(z);
        taken[best] = true;
    }
    std::size_t next = 0;
    for (std::size_t i = 0; i < count && next < nums.size(); ++i) {
        if (taken[i]) continue;
        assigned[i] = nums[next++];
        taken[i] = true;
    }

    SosList sos(count);
    for (std::size_t i = 0; i < count; ++i) {
        sos[i] = Sos{1.0, assigned[i].c1, assigned[i].c2, dens[i].c1, dens[i].c2};
        const double g = std::abs(sos[i].response(fRef, fs));
        if (g > 0.0) {
            sos[i].b0 /= g;
            sos[i].b1 /= g;
            sos[i].b2 /= g;
        }
    }
    const double total = std::abs(response(sos, fRef, fs));
    const double scale = total > 0.0 ? gainAtRef / total : 1.0;
    sos.back().b0 *= scale;
    sos.back().b1 *= scale;
    sos.back().b2 *= scale;
    return sos;
}

Complex response(const SosList& sos, double f, double fs) {
    Complex h = 1.0;
    for (const Sos& s : sos) h *= s.response(f, fs);
    return h;
}

double magnitudeDb(const SosList& sos, double f, double fs) {
    return 20.0 * std::log10(std::max(std::abs(response(sos, f, fs)), 1e-300));
}

Complex analogResponse(const Zpk& analog, double w) {
    const Complex s(0.0, w);
    Complex h = analog.gain;
    for (const Complex& z : analog.zeros) h *= s - z;
    for (const Complex& p : analog.poles) h /= s - p;
    return h;
}

double settleSeconds(const SosList& sos, double fs, double decayDb) {
    double radius = 0.0;
    for (const Sos& s : sos) radius = std::max(radius, s.poleRadius());
    if (radius <= 0.0) return 0.0;
    const double nepers = decayDb / 20.0 * std::log(10.0);
    return nepers / -std::log(radius) / fs;
}

}  // namespace design
}  // namespace SlmLibrary
