// What a call asks about two arrays, from its keyword arguments.

#pragma once

#include "question.h"

#include <pybind11/pybind11.h>

#include <string>

namespace talcmp {

struct CallOptions {
    Question question;
    pybind11::object ignore = pybind11::none();   // the mask
    pybind11::object progress = pybind11::none(); // a function
    std::string name1 = "first";
    std::string name2 = "second";
};

// Takes keyword arguments one by one. Raises TypeError and ValueError, which name the argument.
class CallOptionsReader {
  public:
    // `function` is what messages call the function that is called.
    explicit CallOptionsReader(const char* const function) : function_(function) {}

    // None stands for what holds without the argument.
    void take(pybind11::handle name, pybind11::handle value);

    // After the last argument.
    CallOptions finish() &&;

  private:
    const char* function_;
    CallOptions options_;
    bool has_tolerance_ = false;
};

CallOptions call_options(const char* function, const pybind11::dict& given);

} // namespace talcmp
