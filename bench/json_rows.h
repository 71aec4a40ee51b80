#ifndef TALNUMERICARRAY_BENCH_JSON_ROWS_H
#define TALNUMERICARRAY_BENCH_JSON_ROWS_H

// What stands in front of each row of a list of JSON.
class RowMark {
  public:
    const char* next() {
        const char* const mark = mark_;
        mark_ = ",\n";
        return mark;
    }

  private:
    const char* mark_ = "[\n";
};

#endif
