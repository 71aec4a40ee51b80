// An array in memory.

#ifndef TALNUMERICARRAY_TESTS_MEMORY_ARRAY_H
#define TALNUMERICARRAY_TESTS_MEMORY_ARRAY_H

#include "array_source.h"
#include "taldata_array_element_types.h"

#include <algorithm>
#include <atomic>
#include <chrono>
#include <cstdint>
#include <stdexcept>
#include <thread>
#include <utility>
#include <vector>

enum class Order { c, fortran };
enum class Access { random, once };

// Elements in the order in which they are stored. What the contract of sources forbids is thrown.
template <typename T>
class MemoryArray : public talcmp::ArraySource {
  public:
    MemoryArray(talcmp::Shape shape, std::vector<T> elements, const Order order = Order::c,
                const Access access = Access::random)
        : shape_(std::move(shape)), elements_(std::move(elements)), order_(order), access_(access) {
    }

    const talcmp::ElementType& type() const override {
        return talcmp::element_type(element_type_id<T>);
    }
    const talcmp::Shape& shape() const override { return shape_; }
    bool fortran_order() const override { return order_ == Order::fortran; }
    bool random_access() const override { return access_ == Access::random; }

    void read(const std::uint64_t first, const std::uint64_t count, void* elements) override {
        if (count > elements_.size() || first > elements_.size() - count) {
            throw std::logic_error("elements are read that the array does not have");
        }
        if (access_ == Access::once) {
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

    talcmp::Shape shape_;
    std::vector<T> elements_;
    Order order_;
    Access access_;
    std::atomic<bool> reading_ = false;
    std::uint64_t read_ = 0; // elements that can be read only once
};

#endif
