// Lists of rows, printed as JSON.

#pragma once

#include <cstddef>
#include <cstdio>
#include <string>

class JsonRows {
  public:
    class Row {
      public:
        Row& add(const char* const name, const std::string& text) {
            begin_field(name);
            std::printf("\"%s\"", text.c_str());
            return *this;
        }
        Row& add(const char* const name, const std::size_t number) {
            begin_field(name);
            std::printf("%zu", number);
            return *this;
        }
        Row& add(const char* const name, const double nanoseconds) {
            begin_field(name);
            std::printf("%.3f", nanoseconds);
            return *this;
        }

        Row(const Row&) = delete;
        Row& operator=(const Row&) = delete;
        ~Row() { std::printf("}"); }

      private:
        friend JsonRows;
        explicit Row(const char* const before) : before_(before) {}

        void begin_field(const char* const name) {
            std::printf("%s\"%s\": ", before_, name);
            before_ = ", ";
        }

        const char* before_;
    };

    // Complete when it goes out of scope.
    Row row() {
        const char* const before = before_row_;
        before_row_ = ",\n{";
        return Row(before);
    }

  private:
    const char* before_row_ = "[\n{";
};
