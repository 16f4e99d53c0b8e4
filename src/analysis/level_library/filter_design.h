// Filter design in double precision: analog prototypes (Butterworth, Chebyshev type II),
// frequency transforms, the bilinear transform with pre-warping, and pairing of the
// digital poles and zeros into second-order sections.
//
// Everything here runs once, when a filter is set up; the sections it produces are then
// copied into the small per-channel processing states (sos.h).
#pragma once

#include <complex>
#include <vector>

namespace SlmLibrary {

using Complex = std::complex<double>;

// One second-order section H(z) = (b0 + b1 z^-1 + b2 z^-2) / (1 + a1 z^-1 + a2 z^-2).
struct Sos {
    double b0 = 1.0;
    double b1 = 0.0;
    double b2 = 0.0;
    double a1 = 0.0;
    double a2 = 0.0;

    Complex response(double f, double fs) const;
    // Largest pole radius (0 for an FIR section).
    double poleRadius() const;
};

using SosList = std::vector<Sos>;

// Zeros, poles and gain: H = gain * prod(x - zero) / prod(x - pole), x = s or z.
struct Zpk {
    std::vector<Complex> zeros;
    std::vector<Complex> poles;
    double gain = 1.0;
};

namespace design {

// Low-pass prototypes with their corner at 1 rad/s and unity gain at DC.
Zpk butterworthPrototype(int order);
// Chebyshev type II: flat pass band, equiripple stop band at least stopbandDb down from
// 1 rad/s on.
Zpk chebyshev2Prototype(int order, double stopbandDb);

// Frequency transforms of a low-pass prototype (frequencies in rad/s).
Zpk lowpassToLowpass(const Zpk& proto, double w);
Zpk lowpassToHighpass(const Zpk& proto, double w);
Zpk lowpassToBandpass(const Zpk& proto, double w0, double bw);
Zpk lowpassToBandstop(const Zpk& proto, double w0, double bw);

// The analog frequency (rad/s) that the bilinear transform at fs maps onto f (Hz).
double prewarp(double f, double fs);
Zpk bilinear(const Zpk& analog, double fs);

// Pairs conjugate poles and zeros into sections (most damped poles first). Real zeros are
// paired largest with smallest, so a band-pass gets (1 - z^-2) in every section. Each
// section is scaled to unity gain at fRef; the last section then carries the overall gain
// that makes the whole filter's gain at fRef equal `gainAtRef`.
SosList toSos(const Zpk& digital, double fRef, double fs, double gainAtRef);

Complex response(const SosList& sos, double f, double fs);
double magnitudeDb(const SosList& sos, double f, double fs);
Complex analogResponse(const Zpk& analog, double w);

// Time for the slowest pole of the cascade to decay by decayDb, in seconds.
double settleSeconds(const SosList& sos, double fs, double decayDb);

}  // namespace design
}  // namespace SlmLibrary
