// What all uses of the HDF5 library share: the lock, handles and the texts of errors.

#pragma once

#include "hdf5_guard.h"
#include "trouble.h"

#include <chrono>
#include <mutex>
#include <optional>
#include <string>
#include <utility>

#include <hdf5.h>

namespace talcmp::hdf5 {

// The longest that one use of the library may take of the processor's time. Nothing but reading
// large chunks takes a second, even if the file is not damaged.
inline constexpr std::chrono::seconds time_to_open = std::chrono::seconds(20);
inline constexpr std::chrono::seconds time_to_read = std::chrono::minutes(10);

// The library is called only while such an object lives: by one thread at a time, as it may not be
// safe for several, and guarded against damaged files. Within a use, another one changes nothing.
class LibraryUse {
  public:
    // `name` is what messages call the file.
    explicit LibraryUse(const std::string& name, std::chrono::seconds limit = time_to_open);
    LibraryUse(const LibraryUse&) = delete;
    LibraryUse& operator=(const LibraryUse&) = delete;
    ~LibraryUse();

  private:
    std::lock_guard<std::recursive_mutex> lock_;
    std::optional<Guard> guard_; // not within another use
};

// An open object of the library, of any kind, which is closed at the end.
class Handle {
  public:
    Handle() = default;
    explicit Handle(const hid_t id) : id_(id) {}
    Handle(const Handle&) = delete;
    Handle& operator=(const Handle&) = delete;
    Handle(Handle&& other) noexcept : id_(std::exchange(other.id_, H5I_INVALID_HID)) {}
    Handle& operator=(Handle&& other) noexcept {
        std::swap(id_, other.id_);
        return *this;
    }
    ~Handle();

    hid_t id() const { return id_; }

  private:
    hid_t id_ = H5I_INVALID_HID;
};

// The descriptor by which the library reads the file; nothing if it is not one file on disk.
std::optional<int> descriptor_of(const Handle& file);

// Why the last call has failed, in the words of the library.
std::string library_reason();

// The result of a call. Throws Trouble if it has failed, with `what_failed` and the reason.
template <typename Result>
Result checked(const Result result, const std::string& name, const char* const what_failed) {
    if (result < 0) {
        throw Trouble(name, std::string(what_failed) + ": " + library_reason()
                                + "; is the file complete and undamaged?");
    }
    return result;
}

} // namespace talcmp::hdf5
