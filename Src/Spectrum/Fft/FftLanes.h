#pragma once

#include "Platform/Shuffles.h"

// What the transform's stages ask of a group of neighbouring values. A group is a SIMD register or, for the
// shortest transforms, a plain float or double; each value goes through the same operations in either.
namespace Corvo::Fft {

namespace {

template <typename V>
struct Complex {
    V re, im;
    friend Complex operator+(const Complex& a, const Complex& b) { return {a.re + b.re, a.im + b.im}; }
    friend Complex operator-(const Complex& a, const Complex& b) { return {a.re - b.re, a.im - b.im}; }
    friend Complex operator*(const Complex& a, const Complex& b) {
        return {a.re * b.re - a.im * b.im, a.re * b.im + a.im * b.re};
    }
};

template <typename T>
struct Lanes {
    using Value = T;
    static constexpr std::size_t kWidth = 1;
    static T Load(const T* from) { return *from; }
    static T LoadAligned(const T* from) { return *from; }
    static void Store(T value, T* to) { *to = value; }
    static T Reverse(T value) { return value; }
    static Complex<T> LoadPairs(const T* from) { return {from[0], from[1]}; }
    static void StorePairs(const Complex<T>& value, T* to) {
        to[0] = value.re;
        to[1] = value.im;
    }
    // to[p * Rows + k] = rows[k][p]
    template <std::size_t Rows>
    static void StoreTransposed(const T (&rows)[Rows], T* to) {
        for (std::size_t k = 0; k < Rows; ++k) to[k] = rows[k];
    }
};

template <typename T, typename Arch>
struct Lanes<xsimd::batch<T, Arch>> {
    using Value = T;
    using V = xsimd::batch<T, Arch>;
    using Shuffle = Shuffles<T, Arch>;
    static constexpr std::size_t kWidth = V::size;
    static constexpr std::size_t kSide = 16 / sizeof(T);
    static V Load(const T* from) { return V::load_unaligned(from); }
    static V LoadAligned(const T* from) { return V::load_aligned(from); }
    static void Store(V value, T* to) { value.store_unaligned(to); }
    static V Reverse(V value) { return Shuffle::Reverse(value); }
    static Complex<V> LoadPairs(const T* from) {
        const V a = Shuffle::LoadSixteens(from, 2 * kSide);
        const V b = Shuffle::LoadSixteens(from + kSide, 2 * kSide);
        return {Shuffle::PickEven(a, b), Shuffle::PickOdd(a, b)};
    }
    static void StorePairs(const Complex<V>& value, T* to) {
        Shuffle::StoreSixteens(Shuffle::ZipLow(value.re, value.im), to, 2 * kSide);
        Shuffle::StoreSixteens(Shuffle::ZipHigh(value.re, value.im), to + kSide, 2 * kSide);
    }
    // Squares of 16 bytes a side are turned over in registers; each row of a square is one 16-byte store.
    template <std::size_t Rows>
    static void StoreTransposed(const V (&rows)[Rows], T* to) {
        for (std::size_t first = 0; first < Rows; first += kSide) {
            V square[kSide];
            for (std::size_t i = 0; i < kSide; ++i) square[i] = rows[first + i];
            for (std::size_t round = 1; round < kSide; round *= 2) {
                V zipped[kSide];
                for (std::size_t i = 0; i < kSide / 2; ++i) {
                    zipped[2 * i] = Shuffle::ZipLow(square[i], square[i + kSide / 2]);
                    zipped[2 * i + 1] = Shuffle::ZipHigh(square[i], square[i + kSide / 2]);
                }
                for (std::size_t i = 0; i < kSide; ++i) square[i] = zipped[i];
            }
            for (std::size_t p = 0; p < kSide; ++p)
                Shuffle::StoreSixteens(square[p], to + p * Rows + first, kSide * Rows);
        }
    }
};

}  // namespace
}  // namespace Corvo::Fft
