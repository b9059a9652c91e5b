// Owning C++ wrappers around twrt handles, so that a test or an example calls an export in a line.
#pragma once

#include <complex>
#include <cstdint>
#include <cstring>
#include <initializer_list>
#include <type_traits>
#include <utility>
#include <vector>

#include "twrt.h"

namespace twrt {

// Element data of a block may be only 4-byte aligned, so elements are copied in and out, never
// dereferenced in place.
template <class T>
class Array1D {
    static_assert(std::is_trivially_copyable_v<T>);

public:
    Array1D() : Array1D(0) {}
    explicit Array1D(int32_t n) {
        const int32_t shape[1] = {n};
        h_ = TWRTNewArray(static_cast<int32_t>(sizeof(T)), 1, shape);
    }
    Array1D(std::initializer_list<T> v) : Array1D(std::vector<T>(v)) {}
    explicit Array1D(const std::vector<T>& v) : Array1D(static_cast<int32_t>(v.size())) {
        if (!v.empty()) std::memcpy(data(), v.data(), v.size() * sizeof(T));
    }
    Array1D(Array1D&& o) noexcept : h_(std::exchange(o.h_, nullptr)) {}
    Array1D& operator=(Array1D&& o) noexcept {
        std::swap(h_, o.h_);
        return *this;
    }
    Array1D(const Array1D&) = delete;
    Array1D& operator=(const Array1D&) = delete;
    ~Array1D() { HostDisposeHandle(h_); }

    // The handle as an export takes it.
    void** h() const { return h_; }
    int32_t size() const {
        int32_t n;
        std::memcpy(&n, *h_, sizeof n);
        return n;
    }
    unsigned char* data() const { return static_cast<unsigned char*>(*h_) + 4; }
    T operator[](int32_t i) const {
        T v;
        std::memcpy(&v, data() + static_cast<size_t>(i) * sizeof(T), sizeof(T));
        return v;
    }
    void set(int32_t i, const T& v) { std::memcpy(data() + static_cast<size_t>(i) * sizeof(T), &v, sizeof(T)); }
    std::vector<T> vec() const {
        std::vector<T> v(static_cast<size_t>(size() > 0 ? size() : 0));
        if (!v.empty()) std::memcpy(v.data(), data(), v.size() * sizeof(T));
        return v;
    }

private:
    TWRTHandle h_ = nullptr;
};

template <class T>
class Array2D {
    static_assert(std::is_trivially_copyable_v<T>);

public:
    Array2D() : Array2D(0, 0) {}
    Array2D(int32_t rows, int32_t cols) {
        const int32_t shape[2] = {rows, cols};
        h_ = TWRTNewArray(static_cast<int32_t>(sizeof(T)), 2, shape);
    }
    // Row-major values.
    Array2D(int32_t rows, int32_t cols, const std::vector<T>& v) : Array2D(rows, cols) {
        if (!v.empty()) std::memcpy(data(), v.data(), v.size() * sizeof(T));
    }
    Array2D(Array2D&& o) noexcept : h_(std::exchange(o.h_, nullptr)) {}
    Array2D& operator=(Array2D&& o) noexcept {
        std::swap(h_, o.h_);
        return *this;
    }
    Array2D(const Array2D&) = delete;
    Array2D& operator=(const Array2D&) = delete;
    ~Array2D() { HostDisposeHandle(h_); }

    void** h() const { return h_; }
    int32_t rows() const { return word(0); }
    int32_t cols() const { return word(1); }
    unsigned char* data() const { return static_cast<unsigned char*>(*h_) + 8; }
    T at(int32_t r, int32_t c) const {
        T v;
        std::memcpy(&v, data() + (static_cast<size_t>(r) * static_cast<size_t>(cols()) + c) * sizeof(T),
                    sizeof(T));
        return v;
    }
    std::vector<T> vec() const {
        const int64_t n = static_cast<int64_t>(rows()) * cols();
        std::vector<T> v(static_cast<size_t>(n > 0 ? n : 0));
        if (!v.empty()) std::memcpy(v.data(), data(), v.size() * sizeof(T));
        return v;
    }

private:
    int32_t word(int i) const {
        int32_t w;
        std::memcpy(&w, static_cast<unsigned char*>(*h_) + 4 * i, sizeof w);
        return w;
    }
    TWRTHandle h_ = nullptr;
};

// Chooses where element data land for the arrays made while it lives.
class Placement {
public:
    explicit Placement(bool aligned) : old_(TWRTPlacement()) { TWRTSetPlacement(aligned ? 1 : 0); }
    ~Placement() { TWRTSetPlacement(old_); }
    Placement(const Placement&) = delete;
    Placement& operator=(const Placement&) = delete;

private:
    int32_t old_;
};

// Chooses how resizes behave (TWRTResizeMove, TWRTResizePoison) while it lives.
class ResizeMode {
public:
    explicit ResizeMode(int32_t mode) : old_(TWRTResizeMode()) { TWRTSetResizeMode(mode); }
    ~ResizeMode() { TWRTSetResizeMode(old_); }
    ResizeMode(const ResizeMode&) = delete;
    ResizeMode& operator=(const ResizeMode&) = delete;

private:
    int32_t old_;
};

}  // namespace twrt
