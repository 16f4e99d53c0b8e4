// Bodies of the kernels of kernels.h. kernels.cpp includes this file once per instruction
// set, each time inside its own namespace and with ORV_KERNEL_TARGET set to that set's
// function attributes; it includes no header of its own. Types V4d, V8f, V4f, V4l, V4i, V8i
// (GCC vectors) come from kernels.cpp.
//
// Written with GCC vector types: each operation on eight floats or four doubles is one AVX
// instruction, or two SSE instructions on the generic path.

// No helper takes or returns a vector by value: without AVX that would change the calling
// convention of the generic copy (GCC warns). Selects and broadcasts are the macros
// ORV_SELECT(out, mask, a, b) and ORV_BROADCAST(v, k) of kernels.cpp, written for each
// instruction set (a plain vector ?: would become scalar code on two-register vectors).

// N: state size (2 per section); Decimate: keep the odd outputs only.
template <std::size_t N, bool Decimate>
[[gnu::always_inline]] ORV_KERNEL_TARGET inline void iirRun(const IirBlockPlan& pl, double* state,
                                                            const float* in, std::size_t blocks,
                                                            float* out) {
    constexpr std::size_t kHalves = N > 4 ? 2 : 1;  // four-double parts of the state
    constexpr std::size_t kOut = Decimate ? 1 : 2;  // four-double parts of the outputs
    V4d s[2] = {};
    __builtin_memcpy(&s[0], state, sizeof(V4d));
    if (kHalves == 2) __builtin_memcpy(&s[1], state + 4, sizeof(V4d));
    // Decimated outputs are rows 1, 3, 5, 7: gather those rows of o and t once.
    V4d od[N];
    V4d td[8];
    if (Decimate) {
#pragma GCC unroll 16
        for (std::size_t k = 0; k < N; ++k)
            od[k] = V4d{pl.o[k][1], pl.o[k][3], pl.o[k][5], pl.o[k][7]};
#pragma GCC unroll 16
        for (std::size_t i = 0; i < 8; ++i)
            td[i] = V4d{pl.t[i][1], pl.t[i][3], pl.t[i][5], pl.t[i][7]};
    }
    for (std::size_t b = 0; b < blocks; ++b) {
        const float* x = in + b * 8;
        V4d u[8];
#pragma GCC unroll 16
        for (std::size_t i = 0; i < 8; ++i) u[i] = static_cast<double>(x[i]) - V4d{};
        // Inputs first (independent of the state), then the state, in four partial sums so
        // that the recursion from one block's state to the next is short.
        V4d next[2][4] = {};
        V4d y[2][2] = {};
#pragma GCC unroll 16
        for (std::size_t i = 0; i < 8; ++i) {
#pragma GCC unroll 16
            for (std::size_t h = 0; h < kHalves; ++h) {
                V4d col;
                __builtin_memcpy(&col, &pl.q[i][h * 4], sizeof col);
                next[h][i % 2] += col * u[i];
            }
            if (Decimate) {
                y[0][i % 2] += td[i] * u[i];
            } else {
#pragma GCC unroll 16
                for (std::size_t h = 0; h < kOut; ++h) {
                    if (h == 0 && i >= 4) continue;  // rows 0..3 do not see inputs 4..7
                    V4d col;
                    __builtin_memcpy(&col, &pl.t[i][h * 4], sizeof col);
                    y[h][i % 2] += col * u[i];
                }
            }
        }
#pragma GCC unroll 16
        for (std::size_t k = 0; k < N; ++k) {
            const V4d sk = ORV_BROADCAST(s[k / 4], k % 4);
#pragma GCC unroll 16
            for (std::size_t h = 0; h < kHalves; ++h) {
                V4d col;
                __builtin_memcpy(&col, &pl.p[k][h * 4], sizeof col);
                next[h][2 + k % 2] += col * sk;
            }
            if (Decimate) {
                y[0][k % 2] += od[k] * sk;
            } else {
#pragma GCC unroll 16
                for (std::size_t h = 0; h < kOut; ++h) {
                    V4d col;
                    __builtin_memcpy(&col, &pl.o[k][h * 4], sizeof col);
                    y[h][k % 2] += col * sk;
                }
            }
        }
#pragma GCC unroll 16
        for (std::size_t h = 0; h < kHalves; ++h)
            s[h] = (next[h][0] + next[h][1]) + (next[h][2] + next[h][3]);
#pragma GCC unroll 16
        for (std::size_t h = 0; h < kOut; ++h) {
            const V4f f = __builtin_convertvector(y[h][0] + y[h][1], V4f);
            __builtin_memcpy(out + b * (Decimate ? 4 : 8) + h * 4, &f, sizeof f);
        }
    }
    __builtin_memcpy(state, &s[0], sizeof(V4d));
    if (kHalves == 2) __builtin_memcpy(state + 4, &s[1], sizeof(V4d));
}

// The same cascade sample by sample (transposed direct form II, the state of iirRun).
template <std::size_t N, bool Decimate>
[[gnu::always_inline]] ORV_KERNEL_TARGET inline void iirSerial(const IirBlockPlan& pl,
                                                               double* state, const float* in,
                                                               std::size_t blocks, float* out) {
    constexpr std::size_t K = N / 2;
    double c[K][5], s1[K], s2[K];
#pragma GCC unroll 4
    for (std::size_t k = 0; k < K; ++k) {
        for (std::size_t j = 0; j < 5; ++j) c[k][j] = pl.sos[k][j];
        s1[k] = state[2 * k];
        s2[k] = state[2 * k + 1];
    }
    std::size_t written = 0;
    for (std::size_t i = 0; i < blocks * 8; ++i) {
        double x = in[i];
#pragma GCC unroll 4
        for (std::size_t k = 0; k < K; ++k) {
            const double y = c[k][0] * x + s1[k];
            s1[k] = (c[k][1] * x + s2[k]) - c[k][3] * y;
            s2[k] = c[k][2] * x - c[k][4] * y;
            x = y;
        }
        if (!Decimate || i % 2 == 1) out[written++] = static_cast<float>(x);
    }
#pragma GCC unroll 4
    for (std::size_t k = 0; k < K; ++k) {
        state[2 * k] = s1[k];
        state[2 * k + 1] = s2[k];
    }
}

#define ORV_IIR_ENTRY(NAME, N, DECIMATE)                                                \
    ORV_KERNEL_TARGET void NAME(const IirBlockPlan& pl, double* state, const float* in, \
                                std::size_t blocks, float* out) {                       \
        if constexpr (kIirBlocks) {                                                     \
            iirRun<N, DECIMATE>(pl, state, in, blocks, out);                            \
        } else {                                                                        \
            iirSerial<N, DECIMATE>(pl, state, in, blocks, out);                         \
        }                                                                               \
    }
ORV_IIR_ENTRY(iir2, 2, false)
ORV_IIR_ENTRY(iir4, 4, false)
ORV_IIR_ENTRY(iir6, 6, false)
ORV_IIR_ENTRY(iir8, 8, false)
ORV_IIR_ENTRY(decimate2, 2, true)
ORV_IIR_ENTRY(decimate4, 4, true)
ORV_IIR_ENTRY(decimate6, 6, true)
ORV_IIR_ENTRY(decimate8, 8, true)
#undef ORV_IIR_ENTRY

// Lanes of band filters. Float: one eight-float vector; double: two four-double halves.
template <typename T>
struct LaneVec;
template <>
struct LaneVec<float> {
    using V = V8f;
    static constexpr std::size_t kParts = 1;
};
template <>
struct LaneVec<double> {
    using V = V4d;
    static constexpr std::size_t kParts = 2;
};

template <typename T, std::size_t K>
[[gnu::always_inline]] ORV_KERNEL_TARGET inline void lanesRun(const T* uLow, const T* uHigh,
                                                              std::size_t n, float* out,
                                                              const T* coef, const T* gain,
                                                              const T* pick, T* state) {
    using V = typename LaneVec<T>::V;
    constexpr std::size_t P = LaneVec<T>::kParts;
    constexpr std::size_t L = 8 / P;  // lanes per part
    V a1[K][P], a2[K][P], w1[K][P], w2[K][P], g[P], sel[P];
#pragma GCC unroll 16
    for (std::size_t p = 0; p < P; ++p) {
#pragma GCC unroll 16
        for (std::size_t k = 0; k < K; ++k) {
            __builtin_memcpy(&a1[k][p], coef + (2 * k) * 8 + p * L, sizeof(V));
            __builtin_memcpy(&a2[k][p], coef + (2 * k + 1) * 8 + p * L, sizeof(V));
            __builtin_memcpy(&w1[k][p], state + (2 * k) * 8 + p * L, sizeof(V));
            __builtin_memcpy(&w2[k][p], state + (2 * k + 1) * 8 + p * L, sizeof(V));
        }
        __builtin_memcpy(&g[p], gain + p * L, sizeof(V));
        __builtin_memcpy(&sel[p], pick + p * L, sizeof(V));
    }
    const bool mixed = uLow != uHigh;
    for (std::size_t i = 0; i < n; ++i) {
        const V lo = uLow[i] - V{};  // broadcasts (x - 0 is x exactly)
        const V hi = uHigh[i] - V{};
#pragma GCC unroll 16
        for (std::size_t p = 0; p < P; ++p) {
            V x = lo;
            if (mixed) ORV_SELECT(x, sel[p] != 0, hi, lo);
#pragma GCC unroll 16
            for (std::size_t k = 0; k < K; ++k) {
                // w[n-2] first: the recursion through w[n-1] is a single multiply-add.
                const V t = x - a2[k][p] * w2[k][p];
                const V w = t - a1[k][p] * w1[k][p];
                w2[k][p] = w1[k][p];
                w1[k][p] = w;
                x = w;
            }
            x *= g[p];
            if constexpr (P == 1) {
                __builtin_memcpy(out + i * 8, &x, sizeof x);
            } else {
                const V4f f = __builtin_convertvector(x, V4f);
                __builtin_memcpy(out + i * 8 + p * L, &f, sizeof f);
            }
        }
    }
#pragma GCC unroll 16
    for (std::size_t p = 0; p < P; ++p) {
#pragma GCC unroll 16
        for (std::size_t k = 0; k < K; ++k) {
            __builtin_memcpy(state + (2 * k) * 8 + p * L, &w1[k][p], sizeof(V));
            __builtin_memcpy(state + (2 * k + 1) * 8 + p * L, &w2[k][p], sizeof(V));
        }
    }
}

#define ORV_LANES_ENTRY(NAME, T, K)                                                              \
    ORV_KERNEL_TARGET void NAME(const T* lo, const T* hi, std::size_t n, float* out, const T* c, \
                                const T* g, const T* pick, T* s) {                               \
        lanesRun<T, K>(lo, hi, n, out, c, g, pick, s);                                           \
    }
ORV_LANES_ENTRY(lanesF1, float, 1)
ORV_LANES_ENTRY(lanesF2, float, 2)
ORV_LANES_ENTRY(lanesF3, float, 3)
ORV_LANES_ENTRY(lanesF4, float, 4)
ORV_LANES_ENTRY(lanesD1, double, 1)
ORV_LANES_ENTRY(lanesD2, double, 2)
ORV_LANES_ENTRY(lanesD3, double, 3)
ORV_LANES_ENTRY(lanesD4, double, 4)
#undef ORV_LANES_ENTRY

// (1 - z^-2)^Order of x (x[-8] .. x[-1] readable), in double, stored as T; eight outputs a
// step.
template <typename T, unsigned Order>
[[gnu::always_inline]] ORV_KERNEL_TARGET inline void zerosRun(const float* x, std::size_t n,
                                                              T* out) {
    constexpr double kCoef[5][5] = {
        {1, 0, 0, 0, 0}, {1, -1, 0, 0, 0}, {1, -2, 1, 0, 0}, {1, -3, 3, -1, 0}, {1, -4, 6, -4, 1}};
    std::size_t i = 0;
    for (; i + 4 <= n; i += 4) {
        V4f v;
        __builtin_memcpy(&v, x + i, sizeof v);
        V4d acc = __builtin_convertvector(v, V4d);
#pragma GCC unroll 4
        for (unsigned j = 1; j <= Order; ++j) {
            __builtin_memcpy(&v, x - 2 * j + i, sizeof v);
            acc += kCoef[Order][j] * __builtin_convertvector(v, V4d);
        }
        if constexpr (sizeof(T) == sizeof(float)) {
            const V4f f = __builtin_convertvector(acc, V4f);
            __builtin_memcpy(out + i, &f, sizeof f);
        } else {
            __builtin_memcpy(out + i, &acc, sizeof acc);
        }
    }
    for (; i < n; ++i) {
        double acc = x[i];
        for (unsigned j = 1; j <= Order; ++j)
            acc += kCoef[Order][j] * static_cast<double>((x - 2 * j)[i]);
        out[i] = static_cast<T>(acc);
    }
}

#define ORV_ZEROS_ENTRY(NAME, T, ORDER)                                  \
    ORV_KERNEL_TARGET void NAME(const float* x, std::size_t n, T* out) { \
        zerosRun<T, ORDER>(x, n, out);                                   \
    }
ORV_ZEROS_ENTRY(zerosF1, float, 1)
ORV_ZEROS_ENTRY(zerosF2, float, 2)
ORV_ZEROS_ENTRY(zerosF3, float, 3)
ORV_ZEROS_ENTRY(zerosF4, float, 4)
ORV_ZEROS_ENTRY(zerosD1, double, 1)
ORV_ZEROS_ENTRY(zerosD2, double, 2)
ORV_ZEROS_ENTRY(zerosD3, double, 3)
ORV_ZEROS_ENTRY(zerosD4, double, 4)
#undef ORV_ZEROS_ENTRY

template <std::size_t H>
struct MagnitudeVec;
template <>
struct MagnitudeVec<1> {
    using V = V4f;
    using Bits = V4i;
};
template <>
struct MagnitudeVec<2> {
    using V = V8f;
    using Bits = V8i;
};

// Statistics of H four-lane halves (lanes 0 .. 4H-1 of frames eight floats apart): energy,
// time weighting y = (1 - a) y + a p and its extremes, largest magnitude.
template <std::size_t H>
[[gnu::always_inline]] ORV_KERNEL_TARGET inline void levelsRun(const float* frames, std::size_t run,
                                                               const LevelRun& r) {
    using M = typename MagnitudeVec<H>::V;  // the lanes' floats
    using Bits = typename MagnitudeVec<H>::Bits;
    V4d e[H], y[H], mx[H], mn[H];
    M mag;
    for (std::size_t h = 0; h < H; ++h) {
        __builtin_memcpy(&e[h], r.energy + 4 * h, sizeof(V4d));
        __builtin_memcpy(&y[h], r.tw + 4 * h, sizeof(V4d));
        __builtin_memcpy(&mx[h], r.maxima + 4 * h, sizeof(V4d));
        __builtin_memcpy(&mn[h], r.minima + 4 * h, sizeof(V4d));
    }
    __builtin_memcpy(&mag, r.magnitude, sizeof mag);
    const V4d a = r.alpha - V4d{};
    const V4d keep = (1.0 - r.alpha) - V4d{};
    const Bits noSign = (Bits{} + 0x7fffffff);
    for (std::size_t k = 0; k < run; ++k) {
        M v;
        __builtin_memcpy(&v, frames + k * 8, sizeof v);
        Bits bits;
        __builtin_memcpy(&bits, &v, sizeof bits);
        bits &= noSign;
        M av;
        __builtin_memcpy(&av, &bits, sizeof av);
        ORV_MAX_F(mag, av);
#pragma GCC unroll 2
        for (std::size_t h = 0; h < H; ++h) {
            V4f part;
            __builtin_memcpy(&part, frames + k * 8 + 4 * h, sizeof part);
            const V4d d = __builtin_convertvector(part, V4d);
            const V4d p = d * d;
            e[h] += p;
            y[h] = keep * y[h] + a * p;
            ORV_MAX_D(mx[h], y[h]);
            ORV_MIN_D(mn[h], y[h]);
        }
    }
    for (std::size_t h = 0; h < H; ++h) {
        __builtin_memcpy(r.energy + 4 * h, &e[h], sizeof(V4d));
        __builtin_memcpy(r.tw + 4 * h, &y[h], sizeof(V4d));
        __builtin_memcpy(r.maxima + 4 * h, &mx[h], sizeof(V4d));
        __builtin_memcpy(r.minima + 4 * h, &mn[h], sizeof(V4d));
    }
    __builtin_memcpy(r.magnitude, &mag, sizeof mag);
}

ORV_KERNEL_TARGET void levels8(const float* frames, std::size_t run, const LevelRun& r) {
    levelsRun<2>(frames, run, r);
}
ORV_KERNEL_TARGET void levels4(const float* frames, std::size_t run, const LevelRun& r) {
    levelsRun<1>(frames, run, r);
}

const KernelTable kTable = {
    kTableName,
    {iir2, iir4, iir6, iir8},
    {decimate2, decimate4, decimate6, decimate8},
    {lanesF1, lanesF2, lanesF3, lanesF4},
    {lanesD1, lanesD2, lanesD3, lanesD4},
    {zerosF1, zerosF2, zerosF3, zerosF4},
    {zerosD1, zerosD2, zerosD3, zerosD4},
    levels8,
    levels4,
};
