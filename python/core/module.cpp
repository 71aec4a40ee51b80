// The compiled part of the Python package `talnumericarray`.

#include "array_comparison.h"
#include "block_findings.h"
#include "comparison_fields.h"
#include "numpy_array.h"
#include "predicates.h"

namespace py = pybind11;

namespace {

py::dict compare(const py::object& object1, const py::object& object2,
                 const py::kwargs& arguments) {
    talcmp::CallOptions options = talcmp::call_options("compare", arguments);
    options.question.report = true;
    const py::array first = talcmp::array_of(object1, options.name1);
    const py::array second = talcmp::array_of(object2, options.name2);
    return talcmp::fields_of(talcmp::compare_arrays(first, second, options), options.question);
}

} // namespace

PYBIND11_MODULE(_core, module) {
    module.doc() = "The compiled part of talnumericarray.";
    module.attr("__version__") = TALNUMERICARRAY_VERSION;
    talcmp::add_predicates(module);
    module.def("compare", compare, py::arg("first"), py::arg("second"), py::pos_only(),
               "The fields of talnumericarray.Comparison for two arrays.");
    talcmp::add_block_findings(module);
}
