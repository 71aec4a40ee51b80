#include "predicates.h"

#include "array_comparison.h"
#include "numpy_array.h"

#include <algorithm>
#include <new>
#include <string>

namespace py = pybind11;

namespace talcmp {
namespace {

constexpr const char* same_documentation =
    R"(same($module, first, second, /, *, tol=0, relative=None, absolute=None, equal_nan=False, strict_type=False, squeeze=False, slices=None, ignore=None, threads=None, progress=None)
--

Whether two arrays are the same, value by value.

first, second: arrays of numbers or booleans of any shape, or what numpy.asarray makes arrays of.
tol: binary digits in which reals may differ. 0 asks for the same bits; otherwise two reals x and
    y of one sign are the same if |x - y| < 2**(tol - 53) * max(|x|, |y|), 2**(tol - 24) where both
    are singles. Integers are always compared exactly.
relative: the same tolerance as an error between 0 and 1, instead of tol.
absolute: elements that differ by at most so much, from 0 to 1e300, are the same too.
equal_nan: whether a NaN is the same as a NaN.
strict_type: whether arrays of different element types differ.
squeeze: whether axes of length 1 do not matter.
slices: the part of both arrays to compare: "0:10,:,3", or slices and integers as in an index.
ignore: an array of booleans of the shape of first: where it is True, nothing is compared.
threads: the most threads, up to 64; None for as many as are worthwhile.
progress: a function that is called now and then with the numbers of bytes compared and in all.

Returns a bool. Raises TypeError for what is no array of numbers, ValueError for arguments out of
range, and whatever progress raises.

>>> import numpy as np
>>> import talnumericarray as tna
>>> a = np.linspace(0, 1, 5)
>>> tna.same(a, a * (1 + 1e-12))
False
>>> tna.same(a, a * (1 + 1e-12), relative=1e-9)
True
)";

constexpr const char* equivalent_documentation = R"(equivalent($module, first, second, /)
--

Whether two arrays have the same rank, element type and shape, whatever their elements are.

Byte order and order in memory do not matter. Raises TypeError for what is no array of numbers.

>>> import numpy as np
>>> import talnumericarray as tna
>>> tna.equivalent(np.zeros((2, 3)), np.ones((2, 3)))
True
>>> tna.equivalent(np.zeros(3), np.zeros(3, np.float32))
False
)";

// Runs a function that Python calls directly, and hands its exceptions to Python.
template <typename Function>
PyObject* guarded(const Function& function) {
    try {
        return PyBool_FromLong(function() ? 1 : 0);
    } catch (py::error_already_set& error) {
        error.restore();
    } catch (const py::builtin_exception& error) {
        error.set_error();
    } catch (const std::bad_alloc&) {
        PyErr_NoMemory();
    } catch (const std::exception& error) {
        PyErr_SetString(PyExc_RuntimeError, error.what());
    }
    return nullptr;
}

void check_two(const char* const function, const Py_ssize_t count) {
    if (count != 2) {
        throw py::type_error(std::string(function) + "() takes two arrays, not "
                             + std::to_string(count) + " arguments");
    }
}

bool same(const py::handle object1, const py::handle object2, const CallOptions& options) {
    const py::array first = array_of(object1, options.name1);
    const py::array second = array_of(object2, options.name2);
    if (options.ignore.is_none() && options.progress.is_none()) {
        if (const auto answer = same_at_once(first, second, options.question)) {
            return *answer;
        }
    }
    CallOptions any_place = options;
    any_place.question.only_whether = true;
    any_place.question.differences = 1;
    return compare_arrays(first, second, any_place).difference == Difference::none;
}

bool equivalent(const py::handle object1, const py::handle object2) {
    const py::array first = array_of(object1, "first");
    const py::array second = array_of(object2, "second");
    const StoredType type1 = stored_type_of(first.dtype(), "first");
    const StoredType type2 = stored_type_of(second.dtype(), "second");
    return type1.name == type2.name && first.ndim() == second.ndim()
           && std::equal(first.shape(), first.shape() + first.ndim(), second.shape());
}

PyObject* call_same(PyObject* /*module*/, PyObject* const* const values, const Py_ssize_t count,
                    PyObject* const names) {
    return guarded([&] {
        check_two("same", count);
        CallOptionsReader reader("same");
        const Py_ssize_t named = names == nullptr ? 0 : PyTuple_GET_SIZE(names);
        for (Py_ssize_t i = 0; i < named; ++i) {
            reader.take(PyTuple_GET_ITEM(names, i), values[count + i]);
        }
        return same(values[0], values[1], std::move(reader).finish());
    });
}

PyObject* call_equivalent(PyObject* /*module*/, PyObject* const* const values,
                          const Py_ssize_t count) {
    return guarded([&] {
        check_two("equivalent", count);
        return equivalent(values[0], values[1]);
    });
}

template <typename Function>
PyCFunction as_c_function(Function* const function) {
    return reinterpret_cast<PyCFunction>(reinterpret_cast<void (*)()>(function));
}

void add(py::module_& module, PyMethodDef& definition) {
    const py::object name = module.attr("__name__");
    // Of a function that is bound to the module, inspect.signature leaves out $module.
    module.add_object(definition.ml_name, py::reinterpret_steal<py::object>(PyCFunction_NewEx(
                                              &definition, module.ptr(), name.ptr())));
}

} // namespace

void add_predicates(py::module_& module) {
    static PyMethodDef same_method = {"same", as_c_function(call_same),
                                      METH_FASTCALL | METH_KEYWORDS, same_documentation};
    static PyMethodDef equivalent_method = {"equivalent", as_c_function(call_equivalent),
                                            METH_FASTCALL, equivalent_documentation};
    add(module, same_method);
    add(module, equivalent_method);
}

} // namespace talcmp
