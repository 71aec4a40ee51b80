#include "call_options.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <cstdint>
#include <limits>
#include <stdexcept>
#include <utility>

namespace py = pybind11;

namespace talcmp {
namespace {

std::string shown_value(const py::handle value) {
    return static_cast<std::string>(py::repr(value));
}

std::string refusal(const std::string& argument, const std::string& takes, const py::handle value) {
    return argument + " takes " + takes + ", not " + shown_value(value);
}

[[noreturn]] void refuse(const std::string& argument, const std::string& takes,
                         const py::handle value) {
    throw py::value_error(refusal(argument, takes, value));
}

[[noreturn]] void refuse_type(const std::string& argument, const std::string& takes,
                              const py::handle value) {
    throw py::type_error(refusal(argument, takes, value));
}

// ---- Values

double real_from(const char* const argument, const std::string& takes, const py::handle value) {
    const double real = PyFloat_AsDouble(value.ptr());
    if (real == -1 && PyErr_Occurred() != nullptr) {
        if (PyErr_ExceptionMatches(PyExc_TypeError) != 0) {
            PyErr_Clear();
            refuse_type(argument, takes, value);
        }
        if (PyErr_ExceptionMatches(PyExc_OverflowError) != 0) {
            PyErr_Clear();
            refuse(argument, takes, value);
        }
        throw py::error_already_set();
    }
    if (std::isnan(real)) {
        refuse(argument, takes, value);
    }
    return real;
}

double error_from(const char* const argument, const char* const takes,
                  bool (*const is_valid)(double), const py::handle value) {
    const double error = real_from(argument, takes, value);
    if (!is_valid(error)) {
        refuse(argument, takes, value);
    }
    return error;
}

bool flag_from(const py::handle value) {
    const int truth = PyObject_IsTrue(value.ptr());
    if (truth < 0) {
        throw py::error_already_set();
    }
    return truth == 1;
}

// As near as 64 bits come, as in Python's own slices.
std::int64_t index_from(const char* const argument, const std::string& takes,
                        const py::handle value) {
    if (PyIndex_Check(value.ptr()) == 0) {
        refuse_type(argument, takes, value);
    }
    const auto index = py::reinterpret_steal<py::object>(PyNumber_Index(value.ptr()));
    if (!index) {
        throw py::error_already_set();
    }
    int overflow = 0;
    const long long number = PyLong_AsLongLongAndOverflow(index.ptr(), &overflow);
    return overflow == 0  ? number
           : overflow > 0 ? std::numeric_limits<std::int64_t>::max()
                          : std::numeric_limits<std::int64_t>::min() + 1;
}

template <typename Number>
Number number_from(const char* const argument, const Number most, const py::handle value) {
    const std::string takes = "a whole number from 1 to " + std::to_string(most);
    const std::int64_t number = index_from(argument, takes, value);
    if (number < 1 || number > static_cast<std::int64_t>(most)) {
        refuse(argument, takes, value);
    }
    return static_cast<Number>(number);
}

// ---- Slices

std::int64_t slice_index_from(const py::handle value) {
    return index_from("slices",
                      "integers, slices and '...' as in an index, or a text such as \"0:10,:,3\"",
                      value);
}

AxisRange range_from(const py::handle item) {
    AxisRange range;
    if (!PySlice_Check(item.ptr())) {
        range.start = slice_index_from(item);
        range.one_index = true;
        return range;
    }
    const auto bound = [&](const char* const name) -> std::optional<std::int64_t> {
        const py::object value = item.attr(name);
        return value.is_none() ? std::nullopt : std::optional(slice_index_from(value));
    };
    range.start = bound("start");
    range.stop = bound("stop");
    range.step = bound("step").value_or(1);
    if (range.step == 0) {
        throw py::value_error("slices: a step is 0");
    }
    return range;
}

Selection selection_from_items(const py::tuple& items) {
    Selection selection;
    bool after_ellipsis = false;
    for (const py::handle item : items) {
        if (item.ptr() != Py_Ellipsis) {
            (after_ellipsis ? selection.last : selection.first).push_back(range_from(item));
        } else if (after_ellipsis) {
            throw py::value_error("slices: there is more than one '...'");
        } else {
            after_ellipsis = true;
        }
    }
    return selection;
}

Selection selection_from(const py::handle value) {
    if (py::isinstance<py::str>(value)) {
        try {
            return read_selection(static_cast<std::string>(py::str(value)));
        } catch (const std::invalid_argument& error) {
            throw py::value_error(std::string("slices: ") + error.what());
        }
    }
    return selection_from_items(py::isinstance<py::tuple>(value)
                                    ? py::reinterpret_borrow<py::tuple>(value)
                                    : py::make_tuple(value));
}

// ---- Names

std::pair<std::string, std::string> names_from(const py::handle value) {
    const bool is_pair = (PyTuple_Check(value.ptr()) != 0 || PyList_Check(value.ptr()) != 0)
                         && PySequence_Size(value.ptr()) == 2;
    if (is_pair) {
        const auto names = py::reinterpret_borrow<py::sequence>(value);
        if (py::isinstance<py::str>(names[0]) && py::isinstance<py::str>(names[1])) {
            return {names[0].cast<std::string>(), names[1].cast<std::string>()};
        }
    }
    refuse_type("names", "two texts", value);
}

// ---- Arguments by their names

constexpr const char* some_digits = "a number of binary digits, such as 10 or 2.5";

struct Argument {
    const char* name;
    void (*take)(CallOptions& options, py::handle value);
};

constexpr std::array arguments = {
    Argument{"tol",
             [](CallOptions& options, const py::handle value) {
                 options.question.tolerance = real_from("tol", some_digits, value);
             }},
    Argument{"relative",
             [](CallOptions& options, const py::handle value) {
                 options.question.relative =
                     error_from("relative", "an error between 0 and 1, such as 1e-9",
                                is_relative_error, value);
             }},
    Argument{"absolute",
             [](CallOptions& options, const py::handle value) {
                 options.question.absolute =
                     error_from("absolute", "an error from 0 to 1e300, such as 1e-12",
                                is_absolute_error, value);
             }},
    Argument{"equal_nan",
             [](CallOptions& options, const py::handle value) {
                 options.question.equal_nan = flag_from(value);
             }},
    Argument{"strict_type",
             [](CallOptions& options, const py::handle value) {
                 options.question.strict_type = flag_from(value);
             }},
    Argument{"squeeze",
             [](CallOptions& options, const py::handle value) {
                 options.question.squeeze = flag_from(value);
             }},
    Argument{"slices",
             [](CallOptions& options, const py::handle value) {
                 options.question.selection = selection_from(value);
             }},
    Argument{"ignore",
             [](CallOptions& options, const py::handle value) {
                 options.ignore = py::reinterpret_borrow<py::object>(value);
             }},
    Argument{"max_places",
             [](CallOptions& options, const py::handle value) {
                 options.question.differences = number_from("max_places", most_differences, value);
             }},
    Argument{"threads",
             [](CallOptions& options, const py::handle value) {
                 options.question.threads = number_from("threads", most_threads, value);
             }},
    Argument{"progress",
             [](CallOptions& options, const py::handle value) {
                 if (PyCallable_Check(value.ptr()) == 0) {
                     refuse_type("progress", "a function of two numbers", value);
                 }
                 options.progress = py::reinterpret_borrow<py::object>(value);
             }},
    Argument{"names",
             [](CallOptions& options, const py::handle value) {
                 std::tie(options.name1, options.name2) = names_from(value);
             }},
};

const Argument* argument_named(const py::handle name) {
    const auto* const found =
        std::find_if(arguments.begin(), arguments.end(), [&](const Argument& argument) {
            return PyUnicode_CompareWithASCIIString(name.ptr(), argument.name) == 0;
        });
    return found == arguments.end() ? nullptr : found;
}

// An error is easily taken for a number of digits.
void warn_of_tolerance(const talreal tolerance) {
    if (!(0 < tolerance && tolerance < 1)) {
        return;
    }
    const auto text = static_cast<std::string>(py::repr(py::float_(tolerance)));
    const std::string warning =
        "tol=" + text + " means " + text + " binary digits; a relative error is relative=" + text;
    if (PyErr_WarnEx(PyExc_UserWarning, warning.c_str(), 1) != 0) {
        throw py::error_already_set();
    }
}

} // namespace

void CallOptionsReader::take(const py::handle name, const py::handle value) {
    const Argument* const argument = argument_named(name);
    if (argument == nullptr) {
        throw py::type_error(std::string(function_) + "() got an unexpected keyword argument "
                             + shown_value(name));
    }
    if (!value.is_none()) {
        argument->take(options_, value);
        has_tolerance_ = has_tolerance_ || argument == arguments.data();
    }
}

CallOptions CallOptionsReader::finish() && {
    if (has_tolerance_ && options_.question.relative) {
        throw py::value_error("tol and relative both say how much reals may differ; give one");
    }
    warn_of_tolerance(options_.question.tolerance);
    return std::move(options_);
}

CallOptions call_options(const char* const function, const py::dict& given) {
    CallOptionsReader reader(function);
    for (const auto& [name, value] : given) {
        reader.take(name, value);
    }
    return std::move(reader).finish();
}

} // namespace talcmp
