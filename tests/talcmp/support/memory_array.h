// Arrays that no file holds.

#pragma once

#include "array_source.h"
#include "taldata_array_element_types.h"

#include <algorithm>
#include <atomic>
#include <chrono>
#include <cstdint>
#include <functional>
#include <stdexcept>
#include <thread>
#include <utility>
#include <vector>

enum class Order { c, fortran };
enum class Access { random, once };

template <typename T>
class TypedArray : public talcmp::ArraySource {
  public:
    explicit TypedArray(talcmp::Shape shape, const Order order = Order::c,
                        const Access access = Access::random)
        : shape_(std::move(shape)), order_(order), access_(access) {}

    const talcmp::ElementType& type() const override {
        return talcmp::element_type(element_type_id<T>);
    }
    const talcmp::Shape& shape() const override { return shape_; }
    bool fortran_order() const override { return order_ == Order::fortran; }
    bool random_access() const override { return access_ == Access::random; }

  private:
    talcmp::Shape shape_;
    Order order_;
    Access access_;
};

// An array whose elements a function computes from their positions.
template <typename T>
class FunctionArray : public TypedArray<T> {
  public:
    using Read = std::function<void(std::uint64_t first, std::uint64_t count, T* elements)>;

    FunctionArray(talcmp::Shape shape, Read read, const Order order = Order::c,
                  const Access access = Access::random)
        : TypedArray<T>(std::move(shape), order, access), read_(std::move(read)) {}

    void read(const std::uint64_t first, const std::uint64_t count, void* elements) override {
        read_(first, count, static_cast<T*>(elements));
    }

  private:
    Read read_;
};

// Zeros, except a one at the position `one`.
template <typename T>
void read_zeros_and_one(const std::uint64_t one, const std::uint64_t first,
                        const std::uint64_t count, T* elements) {
    std::fill_n(elements, count, T(0));
    if (first <= one && one < first + count) {
        elements[one - first] = 1;
    }
}

// Elements in the order in which they are stored. Throws if the contract of sources is broken.
template <typename T>
class MemoryArray : public TypedArray<T> {
  public:
    MemoryArray(talcmp::Shape shape, std::vector<T> elements, const Order order = Order::c,
                const Access access = Access::random)
        : TypedArray<T>(std::move(shape), order, access), elements_(std::move(elements)) {}

    void read(const std::uint64_t first, const std::uint64_t count, void* elements) override {
        if (count > elements_.size() || first > elements_.size() - count) {
            throw std::logic_error("elements are read that the array does not have");
        }
        if (!this->random_access()) {
            read_once(first, count);
        }
        std::copy_n(elements_.data() + first, count, static_cast<T*>(elements));
    }

  private:
    // Takes its time, so that another thread that reads meanwhile is noticed.
    void read_once(const std::uint64_t first, const std::uint64_t count) {
        if (reading_.exchange(true)) {
            throw std::logic_error("elements that can be read only once are read by two threads");
        }
        std::this_thread::sleep_for(std::chrono::milliseconds(1));
        if (first < read_) {
            throw std::logic_error("elements that can be read only once are read twice");
        }
        read_ = first + count;
        reading_ = false;
    }

    std::vector<T> elements_;
    std::atomic<bool> reading_ = false;
    std::uint64_t read_ = 0; // elements that can be read only once
};
