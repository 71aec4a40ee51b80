// The predicate against the worked examples, in arrays of one element each.

#include "talnumericarray_compare.h"

#include "support/arrays.h"
#include "support/worked_examples.h"

#include <gtest/gtest.h>

#include <complex>

namespace {

// In a thread for each, so that what one of them makes its thread remember does not reach the
// others.
TEST(WorkedExamples, OfElementsHaveTheirAnswers) {
    std::size_t index = 0;
    for (const ExampleOfElements& example : examples_of_elements()) {
        SCOPED_TRACE(testing::Message()
                     << "example " << index++ << ", types " << example.element1.type() << " and "
                     << example.element2.type());
        ExampleElement element1 = example.element1;
        ExampleElement element2 = example.element2;
        const ArrayRecord array1(element1.type(), element1.data(), 1);
        const ArrayRecord array2(element2.type(), element2.data(), 1);
        const int expected = example.same ? 1 : 0;
        for (const double tol : example.tolerances) {
            in_new_thread([&] {
                EXPECT_EQ(TalNumericArray_sameQ(tol, 1, array1.handle(), array2.handle()), expected)
                    << tol;
                EXPECT_EQ(TalNumericArray_sameQ(tol, 1, array2.handle(), array1.handle()), expected)
                    << tol << ", swapped";
            });
        }
    }
}

// Where the real parts differ in their leading digit, the imaginary parts are not compared, and so
// change nothing that is remembered.
TEST(ComplexAgainstComplex, ImaginaryPartsComeSecond) {
    using Complex = std::complex<double>;
    in_new_thread([] {
        EXPECT_EQ(sameQ_of(52.5, Complex(1.0, 1.0), Complex(2.5, 1.1)), 0);
        EXPECT_EQ(sameQ_of(52.5, 1.0, 2.5), 0) << "the factor is not remembered yet";
        EXPECT_EQ(sameQ_of(52.5, Complex(1.0, 1.0), Complex(1.1, 2.5)), 1);
    });
}

TEST(Order, NothingAfterTheFirstDifferenceMatters) {
    EXPECT_EQ(sameQ(10, Array<double>{1, nan_of_doubles, infinity},
                    Array<double>{2, nan_of_doubles, infinity}),
              0);
    EXPECT_EQ(sameQ(10, Array<double>{1, 2, 3}, Array<double>{2, 2, 3}), 0);
}

// What is remembered on the way through an array decides for a tolerance that leaves less than one
// digit, so the elements have to be taken in order.
TEST(Order, IsThatOfTheElements) {
    in_new_thread([] {
        EXPECT_EQ(sameQ(52.5, Array<double>{1.0, 1.0}, Array<double>{2.5, 1.1}), 0);
        EXPECT_EQ(sameQ(52.5, Array<double>{1.0, 1.0}, Array<double>{1.1, 2.5}), 1);
        EXPECT_EQ(sameQ(52.5, Array<double>{1.0, 1.0}, Array<double>{2.5, 1.1}), 1);
    });
}

} // namespace
