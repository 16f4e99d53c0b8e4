// Bodies of the kernels of kernels.h. kernels.cpp includes this file once per instruction
// set, each time inside its own namespace and with ORV_KERNEL_TARGET set to that set's
// function attributes; it includes no header of its own. With ORV_NARROW_KERNELS defined
// (the generic path) the kernels that kernel_narrow.h writes for 16-byte vectors are left
// out. Types V4d, V8f, V4f, V4l, V4i, V8i
// (GCC vectors) come from kernels.cpp.
//
// Written with GCC vector types: each operation on eight floats or four doubles is one AVX
// instruction, or two SSE instructions on the generic path.

// No helper takes or returns a vector by value: without AVX that would change the calling
// convention of the generic copy (GCC warns). Selects, broadcasts and conversions between
// four floats and four doubles are the macros ORV_SELECT(out, mask, a, b), ORV_BROADCAST(v,
// k), ORV_WIDEN(out, v) and ORV_NARROW(out, v) of kernels.cpp, written for each instruction
// set (a plain vector ?: would become scalar code on two-register vectors, and a generic
// conversion becomes two half conversions through memory in the AVX copy).

// N: state size (2 per section); Decimate: keep the odd outputs only.
template <std::size_t N, bool Decimate>
[[gnu::always_inline]] ORV_KERNEL_TARGET inline void iirRun(const IirBlockPlan& pl, double* state,
                                                            const float* in, std::size_t blocks,
                                                            float* out) {
    constexpr std::size_t B = IirBlockPlan::kBlock;
    constexpr std::size_t kHalves = N > 4 ? 2 : 1;           // four-double parts of the state
    constexpr std::size_t kRows = Decimate ? B / 8 : B / 4;  // four-output rows of a block
    constexpr std::size_t kOut = Decimate ? B / 2 : B;       // outputs of a block
    // Row r of the outputs' columns: input i, state k.
    auto tRow = [&](std::size_t i, std::size_t r) -> const double* {
        if constexpr (Decimate) {
            return &pl.td[i][r * 4];
        } else {
            return &pl.t[i][r * 4];
        }
    };
    auto oRow = [&](std::size_t k, std::size_t r) -> const double* {
        if constexpr (Decimate) {
            return &pl.od[k][r * 4];
        } else {
            return &pl.o[k][r * 4];
        }
    };
    V4d s[2] = {};
    __builtin_memcpy(&s[0], state, sizeof(V4d));
    if (kHalves == 2) __builtin_memcpy(&s[1], state + 4, sizeof(V4d));
    for (std::size_t b = 0; b < blocks; ++b) {
        // The block's inputs as doubles, each broadcast from memory (a load, not a shuffle).
        alignas(32) double x[B];
#pragma GCC unroll 4
        for (std::size_t h = 0; h < B / 4; ++h) {
            V4f part;
            V4d wide;
            __builtin_memcpy(&part, in + b * B + 4 * h, sizeof part);
            ORV_WIDEN(wide, part);
            __builtin_memcpy(x + 4 * h, &wide, sizeof wide);
        }
        // Inputs first (independent of the state), then the state; each sum in two parts so
        // that the chains of dependent multiply-adds are short, above all the recursion from
        // one block's state to the next.
        V4d next[2][4] = {};
        V4d y[kRows][2] = {};
#pragma GCC unroll 16
        for (std::size_t i = 0; i < B; ++i) {
            V4d u;
            ORV_BROADCAST_LOAD(u, x + i);
#pragma GCC unroll 2
            for (std::size_t h = 0; h < kHalves; ++h) {
                V4d col;
                __builtin_memcpy(&col, &pl.q[i][h * 4], sizeof col);
                next[h][i % 2] += col * u;
            }
#pragma GCC unroll 4
            for (std::size_t r = 0; r < kRows; ++r) {
                // An input does not reach the outputs before it.
                const std::size_t last = Decimate ? 8 * r + 7 : 4 * r + 3;
                if (i > last) continue;
                V4d col;
                __builtin_memcpy(&col, tRow(i, r), sizeof col);
                y[r][i % 2] += col * u;
            }
        }
#pragma GCC unroll 8
        for (std::size_t k = 0; k < N; ++k) {
            const V4d sk = ORV_BROADCAST(s[k / 4], k % 4);
#pragma GCC unroll 2
            for (std::size_t h = 0; h < kHalves; ++h) {
                V4d col;
                __builtin_memcpy(&col, &pl.p[k][h * 4], sizeof col);
                next[h][2 + k % 2] += col * sk;
            }
#pragma GCC unroll 4
            for (std::size_t r = 0; r < kRows; ++r) {
                V4d col;
                __builtin_memcpy(&col, oRow(k, r), sizeof col);
                y[r][k % 2] += col * sk;
            }
        }
#pragma GCC unroll 2
        for (std::size_t h = 0; h < kHalves; ++h)
            s[h] = (next[h][2] + next[h][3]) + (next[h][0] + next[h][1]);
#pragma GCC unroll 4
        for (std::size_t r = 0; r < kRows; ++r) {
            V4f f;
            ORV_NARROW(f, y[r][0] + y[r][1]);
            __builtin_memcpy(out + b * kOut + r * 4, &f, sizeof f);
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
    for (std::size_t i = 0; i < blocks * IirBlockPlan::kBlock; ++i) {
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

#if !defined(ORV_NARROW_KERNELS)
// Decimation in single precision: the whole state (up to eight values) in one vector, the
// eight odd outputs of a block in another.
ORV_KERNEL_TARGET void decimateF(const IirBlockPlan& pl, float* state, const float* in,
                                 std::size_t blocks, float* out) {
    constexpr std::size_t B = IirBlockPlan::kBlock;
    V8f s;
    __builtin_memcpy(&s, state, sizeof s);
    for (std::size_t b = 0; b < blocks; ++b) {
        const float* x = in + b * B;
        V8f next[4] = {}, y[4] = {};
#pragma GCC unroll 16
        for (std::size_t i = 0; i < B; ++i) {
            const V8f u = x[i] - V8f{};
            V8f col;
            __builtin_memcpy(&col, pl.qf[i], sizeof col);
            next[i % 2] += col * u;
            __builtin_memcpy(&col, pl.tdf[i], sizeof col);
            y[i % 2] += col * u;
        }
#pragma GCC unroll 8
        for (std::size_t k = 0; k < 8; ++k) {
            V8f sk;
            ORV_BROADCAST_F(sk, s, k);
            V8f col;
            __builtin_memcpy(&col, pl.pf[k], sizeof col);
            next[2 + k % 2] += col * sk;
            __builtin_memcpy(&col, pl.odf[k], sizeof col);
            y[2 + k % 2] += col * sk;
        }
        s = (next[2] + next[3]) + (next[0] + next[1]);
        const V8f outputs = (y[2] + y[3]) + (y[0] + y[1]);
        __builtin_memcpy(out + b * (B / 2), &outputs, sizeof outputs);
    }
    __builtin_memcpy(state, &s, sizeof s);
}

#endif

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

// Statistics of H four-lane halves of n eight-float frames (lanes 0 .. 4H - 1): energy,
// time weighting y = (1 - a) y + a p and its extremes, largest magnitude (all eight lanes).
//
// Eight frames at a time: y after the block is (1 - a)^8 y + sum_j a (1 - a)^(7 - j) p_j,
// independent sums instead of a chain of eight dependent steps. Within the block y stays
// between (1 - a)^8 y and y + a sum_j p_j (p >= 0); only when that range reaches beyond the
// extremes so far are the block's levels computed one by one to update them.
// Squares of lanes 4h .. 4h + 3 of the frame at f.
[[gnu::always_inline]] ORV_KERNEL_TARGET inline void squares(const float* f, std::size_t h,
                                                             V4d& p) {
    V4f part;
    __builtin_memcpy(&part, f + 4 * h, sizeof part);
    V4d d;
    ORV_WIDEN(d, part);
    p = d * d;
}

// mag = max(mag, |frame at f|).
[[gnu::always_inline]] ORV_KERNEL_TARGET inline void largest(const float* f, V8f& mag) {
    V8i bits;
    __builtin_memcpy(&bits, f, sizeof bits);
    bits &= V8i{} + 0x7fffffff;
    V8f av;
    __builtin_memcpy(&av, &bits, sizeof av);
    ORV_MAX_F(mag, av);
}

// One frame's time weighting the direct way, and its extremes; p receives the squares.
[[gnu::always_inline]] ORV_KERNEL_TARGET inline void weigh(const float* f, std::size_t h,
                                                           const V4d& a, const V4d& keep, V4d& y,
                                                           V4d& mx, V4d& mn, V4d& p) {
    squares(f, h, p);
    const V4d ap = a * p;
    y = keep * y + ap;
    ORV_MAX_D(mx, y);
    ORV_MIN_D(mn, y);
}

[[gnu::always_inline]] ORV_KERNEL_TARGET inline bool anyBit(const V8i& v) {
    V4l wide;
    __builtin_memcpy(&wide, &v, sizeof wide);
    return ((wide[0] | wide[1]) | (wide[2] | wide[3])) != 0;
}

// Records frames first .. first + count - 1 for the peak search when their largest
// magnitudes bm reach a lane's threshold.
[[gnu::always_inline]] ORV_KERNEL_TARGET inline void candidate(const LevelRun& r, const V8f& bm,
                                                               const V8f& reach, std::size_t first,
                                                               std::size_t count) {
    const V8i hit = bm >= reach;
    if (anyBit(hit)) {
        r.candidates[2 * *r.candidateCount] = static_cast<std::uint32_t>(first);
        r.candidates[2 * *r.candidateCount + 1] = static_cast<std::uint32_t>(count);
        ++*r.candidateCount;
    }
}

template <std::size_t H>
[[gnu::always_inline]] ORV_KERNEL_TARGET inline void levelsRun(const float* frames, std::size_t n,
                                                               const LevelRun& r) {
    V4d e[H], y[H], mx[H], mn[H];
    V8f mag;
#pragma GCC unroll 2
    for (std::size_t h = 0; h < H; ++h) {
        __builtin_memcpy(&e[h], r.energy + 4 * h, sizeof(V4d));
        __builtin_memcpy(&y[h], r.tw + 4 * h, sizeof(V4d));
        __builtin_memcpy(&mx[h], r.maxima + 4 * h, sizeof(V4d));
        __builtin_memcpy(&mn[h], r.minima + 4 * h, sizeof(V4d));
    }
    __builtin_memcpy(&mag, r.magnitude, sizeof mag);
    V8f reach;
    __builtin_memcpy(&reach, r.reach, sizeof reach);
    const V4d a = r.alpha - V4d{};
    const V4d keep = (1.0 - r.alpha) - V4d{};
    const V4d keep8 = r.weights[8] - V4d{};
    // The sums of a block in single precision (they cover eight squares, each within
    // 6e-8 of its exact value), slightly widened where they bound the levels.
    const float* cf = r.weightsF;
    constexpr double kSlack = 1.0 + 1.0 / 65536.0;
    std::size_t i = 0;
    for (; i + 8 <= n; i += 8) {
        const float* f = frames + i * 8;
        V8f sum[2] = {}, acc[2] = {}, bm = {};
#pragma GCC unroll 8
        for (std::size_t j = 0; j < 8; ++j) {
            largest(f + j * 8, bm);
            V8f x;
            __builtin_memcpy(&x, f + j * 8, sizeof x);
            const V8f p = x * x;
            sum[j % 2] += p;
            acc[j % 2] += cf[j] * p;
        }
        ORV_MAX_F(mag, bm);
        candidate(r, bm, reach, i, 8);
        const V8f sum8 = sum[0] + sum[1];
        const V8f acc8 = acc[0] + acc[1];
        V4d total[H], weighted[H];
        V4l inside = ~V4l{};
#pragma GCC unroll 2
        for (std::size_t h = 0; h < H; ++h) {
            V4f part;
            __builtin_memcpy(&part, reinterpret_cast<const float*>(&sum8) + 4 * h, sizeof part);
            ORV_WIDEN(total[h], part);
            __builtin_memcpy(&part, reinterpret_cast<const float*>(&acc8) + 4 * h, sizeof part);
            ORV_WIDEN(weighted[h], part);
            // NaN is not inside: the direct way then carries it into the extremes.
            inside &= (y[h] + (a * kSlack) * total[h] <= mx[h]) & (keep8 * y[h] >= mn[h]);
        }
        if (!ORV_ALL_SET(inside)) {
#pragma GCC unroll 2
            for (std::size_t h = 0; h < H; ++h) {
                for (std::size_t j = 0; j < 8; ++j) {
                    V4d p;
                    weigh(f + j * 8, h, a, keep, y[h], mx[h], mn[h], p);
                    e[h] += p;
                }
            }
        } else {
#pragma GCC unroll 2
            for (std::size_t h = 0; h < H; ++h) {
                e[h] += total[h];
                y[h] = keep8 * y[h] + weighted[h];
            }
        }
    }
    if (i < n) {
        V8f bm = {};
        for (std::size_t k = i; k < n; ++k) {
            largest(frames + k * 8, bm);
#pragma GCC unroll 2
            for (std::size_t h = 0; h < H; ++h) {
                V4d p;
                weigh(frames + k * 8, h, a, keep, y[h], mx[h], mn[h], p);
                e[h] += p;
            }
        }
        ORV_MAX_F(mag, bm);
        candidate(r, bm, reach, i, n - i);
    }
#pragma GCC unroll 2
    for (std::size_t h = 0; h < H; ++h) {
        __builtin_memcpy(r.energy + 4 * h, &e[h], sizeof(V4d));
        __builtin_memcpy(r.tw + 4 * h, &y[h], sizeof(V4d));
        __builtin_memcpy(r.maxima + 4 * h, &mx[h], sizeof(V4d));
        __builtin_memcpy(r.minima + 4 * h, &mn[h], sizeof(V4d));
    }
    __builtin_memcpy(r.magnitude, &mag, sizeof mag);
}

#if !defined(ORV_NARROW_KERNELS)
ORV_KERNEL_TARGET void levels(const float* frames, std::size_t n, const LevelRun& r) {
    if (r.lanes <= 4) {
        levelsRun<1>(frames, n, r);
    } else {
        levelsRun<2>(frames, n, r);
    }
}
#endif

// Extra: some lanes have one section more than the zeros of the input: their last section
// first applies the remaining (1 - z^-2) to its input, the previous section's output.
template <typename T, std::size_t K, bool Extra>
[[gnu::always_inline]] ORV_KERNEL_TARGET inline void lanesRun(const T* u, std::size_t n, float* out,
                                                              const T* coef, const T* gain,
                                                              const T* zero, T* state) {
    using V = typename LaneVec<T>::V;
    constexpr std::size_t P = LaneVec<T>::kParts;
    constexpr std::size_t L = 8 / P;  // lanes per part
    V a1[K][P], a2[K][P], w1[K][P], w2[K][P], g[P], z[P] = {};
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
        if (Extra) __builtin_memcpy(&z[p], zero + p * L, sizeof(V));
    }
    for (std::size_t i = 0; i < n; ++i) {
        const V in = u[i] - V{};  // broadcast (x - 0 is x exactly)
#pragma GCC unroll 16
        for (std::size_t p = 0; p < P; ++p) {
            V x = in;
            V before = {};  // section K - 2's output two frames back
#pragma GCC unroll 16
            for (std::size_t k = 0; k < K; ++k) {
                if (Extra && k + 2 == K) before = w2[k][p];
                if (Extra && k + 1 == K) x = x - z[p] * before;
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
                V4f f;
                ORV_NARROW(f, x);
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

#if !defined(ORV_NARROW_KERNELS)
#define ORV_LANES_ENTRY(NAME, T, K)                                                            \
    ORV_KERNEL_TARGET void NAME(const T* u, std::size_t n, float* out, const T* c, const T* g, \
                                const T* zero, T* s) {                                         \
        if (zero != nullptr) {                                                                 \
            lanesRun<T, K, true>(u, n, out, c, g, zero, s);                                    \
        } else {                                                                               \
            lanesRun<T, K, false>(u, n, out, c, g, zero, s);                                   \
        }                                                                                      \
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
#endif

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
        V4d acc;
        ORV_WIDEN(acc, v);
#pragma GCC unroll 4
        for (unsigned j = 1; j <= Order; ++j) {
            __builtin_memcpy(&v, x - 2 * j + i, sizeof v);
            V4d w;
            ORV_WIDEN(w, v);
            acc += kCoef[Order][j] * w;
        }
        if constexpr (sizeof(T) == sizeof(float)) {
            V4f f;
            ORV_NARROW(f, acc);
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
