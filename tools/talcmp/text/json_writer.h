// A JSON document that is written piece by piece.

#pragma once

#include <nlohmann/json_fwd.hpp>

#include <cstdio>
#include <string>
#include <vector>

namespace talcmp {

// Lays the document out as if it were written at once, an entry in each line, though no more than a
// piece of it is ever in memory. Keys are for entries of objects only. What is not UTF-8 is
// replaced, as JSON has to be UTF-8; characters that a terminal might take for commands are written
// as their numbers.
class JsonWriter {
  public:
    using Json = nlohmann::ordered_json;

    explicit JsonWriter(std::FILE* const file) : file_(file) {}

    void begin_object(const std::string& key = "") { begin(key, '{', '}'); }
    void begin_array(const std::string& key) { begin(key, '[', ']'); }

    void add(const std::string& key, const Json& value);
    void add(const Json& value) { add("", value); }

    // Ends the object or array that began last and has not ended; the document ends with the first.
    void end();

  private:
    struct Open {
        char end;
        bool empty;
    };

    void begin(const std::string& key, char begin, char end);
    void begin_entry(const std::string& key);
    void print(const std::string& text) const { std::fputs(text.c_str(), file_); }
    std::string line_break() const;

    std::FILE* file_;
    std::vector<Open> open_; // outermost first
};

} // namespace talcmp
