#include "hdf5_handles.h"

#include <cstdio>

namespace talcmp::hdf5 {
namespace {

std::recursive_mutex& library_mutex() {
    static std::recursive_mutex mutex;
    return mutex;
}

// How many uses there are, one within another. Only who has the mutex may read it.
int uses = 0;

// The library would otherwise close what is open when the process ends, and may never finish with
// that after an error.
void prepare_process() {
    static const herr_t prepared = ::H5dont_atexit();
    static_cast<void>(prepared);
}

// The library would otherwise print its errors; each thread has a setting of its own.
void prepare_thread() {
    thread_local const herr_t prepared = ::H5Eset_auto2(H5E_DEFAULT, nullptr, nullptr);
    static_cast<void>(prepared);
}

// Takes the innermost description.
herr_t take_description(const unsigned /*depth*/, const H5E_error2_t* const error,
                        void* const description) {
    auto& text = *static_cast<std::string*>(description);
    if (text.empty() && error->desc != nullptr) {
        text = error->desc;
    }
    return 0;
}

} // namespace

LibraryUse::LibraryUse(const std::string& name, const std::chrono::seconds limit)
    : lock_(library_mutex()) {
    if (uses++ == 0) {
        guard_.emplace(name, limit);
    }
    prepare_process();
    prepare_thread();
}

LibraryUse::~LibraryUse() {
    --uses;
}

Handle::~Handle() {
    if (id_ >= 0) {
        const LibraryUse use("an HDF5 file");
        ::H5Idec_ref(id_);
    }
}

std::optional<int> descriptor_of(const Handle& file) {
    const Handle access(::H5Fget_access_plist(file.id()));
    const hid_t driver = ::H5Pget_driver(access.id());
    void* found = nullptr;
    if (::H5Fget_vfd_handle(file.id(), H5P_DEFAULT, &found) < 0) {
        return std::nullopt;
    }
    if (driver == H5FD_SEC2) {
        return *static_cast<const int*>(found);
    }
    if (driver == H5FD_STDIO) {
        return ::fileno(*static_cast<std::FILE* const*>(found));
    }
    return std::nullopt;
}

std::string library_reason() {
    constexpr std::size_t longest = 120; // bytes; some list all that there is to know about a call
    std::string text;
    ::H5Ewalk2(H5E_DEFAULT, H5E_WALK_UPWARD, take_description, &text);
    if (text.empty()) {
        return "the HDF5 library says no more";
    }
    return text.size() > longest ? text.substr(0, longest) + "..." : text;
}

} // namespace talcmp::hdf5
