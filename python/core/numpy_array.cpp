#include "numpy_array.h"

#include "memory_array.h"

#include <algorithm>
#include <array>
#include <memory>
#include <type_traits>
#include <utility>

namespace py = pybind11;

namespace talcmp {
namespace {

// ---- Kinds of objects

// NumPy's numbers for its own types; those of others are higher.
constexpr int own_types = 24;
constexpr int number_of_half = 23;

bool is_exactly_array(const py::handle object) {
    return reinterpret_cast<PyObject*>(Py_TYPE(object.ptr()))
           == reinterpret_cast<PyObject*>(py::detail::npy_api::get().PyArray_Type_);
}

bool is_masked(const py::handle object) {
    return py::isinstance(object, py::module_::import("numpy.ma").attr("MaskedArray"));
}

// The name of the package that defines the object's type.
std::string package_of(const py::handle object) {
    const auto type = py::reinterpret_borrow<py::object>(py::type::handle_of(object));
    const auto module = py::str(py::getattr(type, "__module__", py::str("")));
    const auto name = static_cast<std::string>(module);
    return name.substr(0, name.find('.'));
}

[[noreturn]] void refuse(const std::string& name, const std::string& what) {
    throw py::type_error(name + " " + what);
}

// ---- Kinds of elements

// What to do about elements that are no numbers of a type that can be compared.
std::string advice_on(const py::dtype& type) {
    switch (type.kind()) {
    case 'O':
        return "give their type if they are numbers, as by .astype(numpy.float64)";
    case 'M':
    case 'm':
        return "compare what is stored, by .view(numpy.int64)";
    case 'U':
    case 'S':
        return "compare it by numpy.array_equal; if it holds numbers, convert it by "
               ".astype(numpy.float64)";
    case 'V':
        return py::getattr(type, "names", py::none()).is_none()
                   ? "convert it to a type of numbers, as by .view or .astype"
                   : "compare it field by field";
    case 'f':
    case 'c':
        return type.num() < own_types
                   ? "round it to doubles, by .astype(numpy."
                         + std::string(type.kind() == 'f' ? "float64" : "complex128") + ")"
                   : "convert it to one of NumPy's types, as by .astype(numpy.float32)";
    default:
        return "convert it to one of NumPy's types of numbers, by .astype";
    }
}

template <typename Type>
constexpr type_t id_of = element_type_id<Type>;

template <typename Integer>
using fixed_width =
    std::conditional_t<std::is_signed_v<Integer>,
                       std::conditional_t<sizeof(Integer) == 4, std::int32_t, std::int64_t>,
                       std::conditional_t<sizeof(Integer) == 4, std::uint32_t, std::uint64_t>>;

// By NumPy's numbers; 0 for types that are converted or not compared.
constexpr std::array<type_t, own_types> ids = {0,
                                               id_of<std::int8_t>,
                                               id_of<std::uint8_t>,
                                               id_of<std::int16_t>,
                                               id_of<std::uint16_t>,
                                               id_of<std::int32_t>,
                                               id_of<std::uint32_t>,
                                               id_of<fixed_width<long>>,
                                               id_of<fixed_width<unsigned long>>,
                                               id_of<std::int64_t>,
                                               id_of<std::uint64_t>,
                                               id_of<float>,
                                               id_of<double>,
                                               0,
                                               id_of<std::complex<float>>,
                                               id_of<std::complex<double>>};

// NumPy usually writes this machine's byte order as '=', but not for types that come from ctypes.
bool is_swapped(const char byte_order) {
    return byte_order == (__BYTE_ORDER__ == __ORDER_LITTLE_ENDIAN__ ? '>' : '<');
}

MemoryLayout layout_of(const py::array& array) {
    return {static_cast<const unsigned char*>(array.data()),
            {array.shape(), array.shape() + array.ndim()},
            {array.strides(), array.strides() + array.ndim()}};
}

} // namespace

std::string type_text(const py::dtype& type) {
    return static_cast<std::string>(py::str(static_cast<py::handle>(type)));
}

py::array array_of(const py::handle object, const std::string& name) {
    if (is_exactly_array(object)) {
        return py::reinterpret_borrow<py::array>(object);
    }
    if (is_masked(object)) {
        refuse(name, "is a masked array; fill it by .filled(value), or compare its .data and leave "
                     "out what is masked by ignore=");
    }
    const std::string package = package_of(object);
    if (package == "dask") {
        refuse(name, "is a Dask collection; use talnumericarray.dask, or .compute()");
    }
    if (package == "xarray" && py::hasattr(object, "data_vars")) {
        refuse(name, "is a dataset; use assert_same, or compare its variables one by one");
    }
    return py::module_::import("numpy").attr("asarray")(object);
}

StoredType stored_type_of(const py::dtype& type, const std::string& name) {
    const char kind = type.kind();
    const auto size = static_cast<std::size_t>(type.itemsize());
    const bool is_own =
        type.num() < own_types && (kind != 'f' || size != 2 || type.num() == number_of_half);
    if (const auto stored = stored_type(kind, size, is_swapped(type.byteorder()));
        stored && is_own) {
        return *stored;
    }
    refuse(name, "has elements of type " + type_text(type) + "; " + advice_on(type));
}

bool is_in_fortran_order(const py::array& array) {
    return is_in_fortran_order(layout_of(array), static_cast<std::size_t>(array.itemsize()));
}

NamedArray source_of(const py::array& array, const std::string& name,
                     const bool by_fortran_positions) {
    return {name, std::make_unique<MemoryArray>(stored_type_of(array.dtype(), name),
                                                layout_of(array), by_fortran_positions)};
}

ArrayFacts facts_of(const py::dtype& type, Shape shape, Shape selected_shape,
                    const std::string& name) {
    const StoredType stored = stored_type_of(type, name);
    return {name, stored.type, stored.name, std::move(shape), std::move(selected_shape), false};
}

type_t id_of_elements(const py::array& array) {
    const auto* const type =
        py::detail::array_descriptor_proxy(py::detail::array_proxy(array.ptr())->descr);
    const bool is_aligned = (array.flags() & py::detail::npy_api::NPY_ARRAY_ALIGNED_) != 0;
    const auto number = static_cast<std::size_t>(type->type_num);
    return is_aligned && number < ids.size() && !is_swapped(type->byteorder) ? ids[number] : 0;
}

} // namespace talcmp
