#include "tweight.h"

#include <cmath>
#include <stdexcept>
#include <string>

namespace SlmLibrary {

double TWeight::timeConstant(unsigned code) {
    switch (code) {
        case F:
            return 0.125;
        case S:
            return 1.0;
        default:
            return 0.0;
    }
}

TWeight::TWeight(unsigned code, double sampleRate, double inputRate) : code_(code) {
    if (!(sampleRate > 0.0) || !(inputRate > 0.0) || inputRate > sampleRate) {
        throw std::invalid_argument(
            "time weighting needs rates with 0 < input rate <= sample rate");
    }
    switch (code) {
        case F:
        case S:
            alpha_ = -std::expm1(-1.0 / (timeConstant(code) * inputRate));
            break;
        case N: {
            const double period = 0.1 * inputRate;
            if (std::abs(period - std::round(period)) > 1e-9 || period < 1.0) {
                throw std::invalid_argument("100 ms is not a whole number of samples at " +
                                            std::to_string(inputRate) + " Hz");
            }
            periodSamples_ = static_cast<std::size_t>(std::lround(period));
            break;
        }
        case I:
            throw std::invalid_argument("impulse time weighting is not supported");
        default:
            throw std::invalid_argument("unknown time weighting code " + std::to_string(code));
    }
}

void TWeight::reset() {
    state_ = 0.0;
    phase_ = 0;
}

void TWeight::Process(float* data, std::size_t n) {
    if (code_ == N) {
        for (std::size_t i = 0; i < n; ++i) {
            state_ += data[i];
            ++phase_;
            data[i] = static_cast<float>(state_ / static_cast<double>(phase_));
            if (phase_ == periodSamples_) {
                state_ = 0.0;
                phase_ = 0;
            }
        }
        return;
    }
    double y = state_;
    const double a = alpha_;
    for (std::size_t i = 0; i < n; ++i) {
        y += a * (static_cast<double>(data[i]) - y);
        data[i] = static_cast<float>(y);
    }
    state_ = y;
}

}  // namespace SlmLibrary
