// Kernels written for 16-byte vectors: four floats or two doubles, the registers of the
// generic code path (SSE2, no fused multiply-add). kernels.cpp includes this file after
// kernel_bodies.h in the generic namespace only and uses these in its table where the forms
// on eight floats or four doubles would run short of registers (each is two here) or build
// vectors element by element through memory. Same results as kernel_bodies.h up to
// rounding (no fused multiply-add, sums in other orders). Types V4f, V2d, V4i, V2l come
// from kernels.cpp.

// Decimation in single precision (decimateF): the state and the outputs as two halves.
inline void decimateNarrow(const IirBlockPlan& pl, float* state, const float* in,
                           std::size_t blocks, float* out) {
    constexpr std::size_t B = IirBlockPlan::kBlock;
    V4f s[2];
    __builtin_memcpy(s, state, sizeof s);
    for (std::size_t b = 0; b < blocks; ++b) {
        const float* x = in + b * B;
        V4f next[2][2] = {}, y[2][2] = {};
        for (std::size_t i = 0; i < B; ++i) {
            const V4f u = x[i] - V4f{};
            for (std::size_t h = 0; h < 2; ++h) {
                V4f col;
                __builtin_memcpy(&col, &pl.qf[i][4 * h], sizeof col);
                next[h][i % 2] += col * u;
                __builtin_memcpy(&col, &pl.tdf[i][4 * h], sizeof col);
                y[h][i % 2] += col * u;
            }
        }
        for (std::size_t k = 0; k < 8; ++k) {
            const V4f sk = s[k / 4][k % 4] - V4f{};
            for (std::size_t h = 0; h < 2; ++h) {
                V4f col;
                __builtin_memcpy(&col, &pl.pf[k][4 * h], sizeof col);
                next[h][k % 2] += col * sk;
                __builtin_memcpy(&col, &pl.odf[k][4 * h], sizeof col);
                y[h][k % 2] += col * sk;
            }
        }
        for (std::size_t h = 0; h < 2; ++h) {
            s[h] = next[h][0] + next[h][1];
            const V4f outputs = y[h][0] + y[h][1];
            __builtin_memcpy(out + b * (B / 2) + 4 * h, &outputs, sizeof outputs);
        }
    }
    __builtin_memcpy(state, s, sizeof s);
}

template <typename T>
struct NarrowVec;
template <>
struct NarrowVec<float> {
    using V = V4f;
};
template <>
struct NarrowVec<double> {
    using V = V2d;
};

// Lanes of band filters (lanesRun), a part of 16 bytes at a time through all frames: four
// float lanes or two double lanes. A part without filters (gain zero in every lane) reads
// zero.
template <typename T, std::size_t K>
inline void lanesNarrow(const T* u, std::size_t n, float* out, const T* coef, const T* gain,
                        const T* zero, T* state) {
    using V = typename NarrowVec<T>::V;
    constexpr std::size_t L = 16 / sizeof(T);  // lanes per part
    for (std::size_t part = 0; part < 8 / L; ++part) {
        const std::size_t first = part * L;
        bool used = false;
        for (std::size_t l = first; l < first + L; ++l) used = used || gain[l] != T{};
        if (!used) {
            for (std::size_t i = 0; i < n; ++i) {
                for (std::size_t l = first; l < first + L; ++l) out[i * 8 + l] = 0.0F;
            }
            continue;
        }
        V a1[K], a2[K], w1[K], w2[K], g, z = {};
        for (std::size_t k = 0; k < K; ++k) {
            __builtin_memcpy(&a1[k], coef + (2 * k) * 8 + first, sizeof(V));
            __builtin_memcpy(&a2[k], coef + (2 * k + 1) * 8 + first, sizeof(V));
            __builtin_memcpy(&w1[k], state + (2 * k) * 8 + first, sizeof(V));
            __builtin_memcpy(&w2[k], state + (2 * k + 1) * 8 + first, sizeof(V));
        }
        __builtin_memcpy(&g, gain + first, sizeof g);
        const bool extra = zero != nullptr;
        if (extra) __builtin_memcpy(&z, zero + first, sizeof z);
        for (std::size_t i = 0; i < n; ++i) {
            V x = u[i] - V{};
            V before = {};
            for (std::size_t k = 0; k < K; ++k) {
                if (extra && k + 2 == K) before = w2[k];
                if (extra && k + 1 == K) x = x - z * before;
                const V t = x - a2[k] * w2[k];
                const V w = t - a1[k] * w1[k];
                w2[k] = w1[k];
                w1[k] = w;
                x = w;
            }
            x *= g;
            if constexpr (L == 4) {
                __builtin_memcpy(out + i * 8 + first, &x, sizeof x);
            } else {
                out[i * 8 + first] = static_cast<float>(x[0]);
                out[i * 8 + first + 1] = static_cast<float>(x[1]);
            }
        }
        for (std::size_t k = 0; k < K; ++k) {
            __builtin_memcpy(state + (2 * k) * 8 + first, &w1[k], sizeof(V));
            __builtin_memcpy(state + (2 * k + 1) * 8 + first, &w2[k], sizeof(V));
        }
    }
}

#define ORV_NARROW_LANES(NAME, T, K)                                                        \
    void NAME(const T* u, std::size_t n, float* out, const T* c, const T* g, const T* zero, \
              T* s) {                                                                       \
        lanesNarrow<T, K>(u, n, out, c, g, zero, s);                                        \
    }
ORV_NARROW_LANES(lanesNarrowF1, float, 1)
ORV_NARROW_LANES(lanesNarrowF2, float, 2)
ORV_NARROW_LANES(lanesNarrowF3, float, 3)
ORV_NARROW_LANES(lanesNarrowF4, float, 4)
ORV_NARROW_LANES(lanesNarrowD1, double, 1)
ORV_NARROW_LANES(lanesNarrowD2, double, 2)
ORV_NARROW_LANES(lanesNarrowD3, double, 3)
ORV_NARROW_LANES(lanesNarrowD4, double, 4)
#undef ORV_NARROW_LANES

// The two doubles of a float pair: lanes 2q, 2q + 1 of v.
inline V2d widenPair(const V4f& v, std::size_t q) {
    return q == 0 ? V2d{v[0], v[1]} : V2d{v[2], v[3]};
}

// Statistics (levelsRun) of H four-lane halves, each as two pairs of doubles; the largest
// magnitudes and the search stretches of all eight lanes.
template <std::size_t H>
inline void levelsNarrow(const float* frames, std::size_t n, const LevelRun& r) {
    V2d e[2][2], y[2][2], mx[2][2], mn[2][2];
    for (std::size_t h = 0; h < H; ++h) {
        __builtin_memcpy(e[h], r.energy + 4 * h, sizeof e[h]);
        __builtin_memcpy(y[h], r.tw + 4 * h, sizeof y[h]);
        __builtin_memcpy(mx[h], r.maxima + 4 * h, sizeof mx[h]);
        __builtin_memcpy(mn[h], r.minima + 4 * h, sizeof mn[h]);
    }
    V4f mag[2], reach[2];
    __builtin_memcpy(mag, r.magnitude, sizeof mag);
    __builtin_memcpy(reach, r.reach, sizeof reach);
    const V2d a = r.alpha - V2d{};
    const V2d keep = (1.0 - r.alpha) - V2d{};
    const V2d keep8 = r.weights[8] - V2d{};
    constexpr double kSlack = 1.0 + 1.0 / 65536.0;  // as levelsRun
    const V4i noSign = V4i{} + 0x7fffffff;
    auto magnitudes = [&](const float* f, V4f(&bm)[2]) {
        for (std::size_t q = 0; q < 2; ++q) {
            V4i bits;
            __builtin_memcpy(&bits, f + 4 * q, sizeof bits);
            bits &= noSign;
            V4f av;
            __builtin_memcpy(&av, &bits, sizeof av);
            bm[q] = __builtin_ia32_maxps(bm[q], av);
        }
    };
    auto direct = [&](const float* f) {
        for (std::size_t h = 0; h < H; ++h) {
            V4f part;
            __builtin_memcpy(&part, f + 4 * h, sizeof part);
            for (std::size_t q = 0; q < 2; ++q) {
                const V2d d = widenPair(part, q);
                const V2d p = d * d;
                e[h][q] += p;
                y[h][q] = keep * y[h][q] + a * p;
                mx[h][q] = __builtin_ia32_maxpd(mx[h][q], y[h][q]);
                mn[h][q] = __builtin_ia32_minpd(mn[h][q], y[h][q]);
            }
        }
    };
    auto candidate = [&](const V4f(&bm)[2], std::size_t first, std::size_t count) {
        for (std::size_t q = 0; q < 2; ++q) mag[q] = __builtin_ia32_maxps(mag[q], bm[q]);
        const V4i hit = (bm[0] >= reach[0]) | (bm[1] >= reach[1]);
        if ((hit[0] | hit[1] | hit[2] | hit[3]) != 0) {
            r.candidates[2 * *r.candidateCount] = static_cast<std::uint32_t>(first);
            r.candidates[2 * *r.candidateCount + 1] = static_cast<std::uint32_t>(count);
            ++*r.candidateCount;
        }
    };
    std::size_t i = 0;
    for (; i + 8 <= n; i += 8) {
        const float* f = frames + i * 8;
        V4f sum[2] = {}, acc[2] = {}, bm[2] = {};
        for (std::size_t j = 0; j < 8; ++j) {
            magnitudes(f + j * 8, bm);
            for (std::size_t h = 0; h < H; ++h) {
                V4f x;
                __builtin_memcpy(&x, f + j * 8 + 4 * h, sizeof x);
                const V4f p = x * x;
                sum[h] += p;
                acc[h] += r.weightsF[j] * p;
            }
        }
        candidate(bm, i, 8);
        bool inside = true;
        V2d total[2][2], weighted[2][2];
        for (std::size_t h = 0; h < H; ++h) {
            for (std::size_t q = 0; q < 2; ++q) {
                total[h][q] = widenPair(sum[h], q);
                weighted[h][q] = widenPair(acc[h], q);
                const V2l in = (y[h][q] + (a * kSlack) * total[h][q] <= mx[h][q]) &
                               (keep8 * y[h][q] >= mn[h][q]);
                inside = inside && (in[0] & in[1]) == -1;
            }
        }
        if (inside) {
            for (std::size_t h = 0; h < H; ++h) {
                for (std::size_t q = 0; q < 2; ++q) {
                    e[h][q] += total[h][q];
                    y[h][q] = keep8 * y[h][q] + weighted[h][q];
                }
            }
        } else {
            for (std::size_t j = 0; j < 8; ++j) direct(f + j * 8);
        }
    }
    if (i < n) {
        V4f bm[2] = {};
        for (std::size_t k = i; k < n; ++k) {
            magnitudes(frames + k * 8, bm);
            direct(frames + k * 8);
        }
        candidate(bm, i, n - i);
    }
    for (std::size_t h = 0; h < H; ++h) {
        __builtin_memcpy(r.energy + 4 * h, e[h], sizeof e[h]);
        __builtin_memcpy(r.tw + 4 * h, y[h], sizeof y[h]);
        __builtin_memcpy(r.maxima + 4 * h, mx[h], sizeof mx[h]);
        __builtin_memcpy(r.minima + 4 * h, mn[h], sizeof mn[h]);
    }
    __builtin_memcpy(r.magnitude, mag, sizeof mag);
}

inline void levelsNarrowEntry(const float* frames, std::size_t n, const LevelRun& r) {
    if (r.lanes <= 4) {
        levelsNarrow<1>(frames, n, r);
    } else {
        levelsNarrow<2>(frames, n, r);
    }
}
