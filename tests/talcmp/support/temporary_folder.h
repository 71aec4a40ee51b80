// A folder for the files of one test, removed with all that is in it at the end.

#pragma once

#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <stdexcept>
#include <string>
#include <system_error>

class TemporaryFolder {
  public:
    TemporaryFolder()
        : path_((std::filesystem::temp_directory_path() / "talcmp-test-XXXXXX").string()) {
        if (::mkdtemp(path_.data()) == nullptr) {
            throw std::runtime_error("no temporary folder " + path_);
        }
    }
    TemporaryFolder(const TemporaryFolder&) = delete;
    TemporaryFolder& operator=(const TemporaryFolder&) = delete;
    ~TemporaryFolder() {
        std::error_code ignored;
        std::filesystem::remove_all(path_, ignored);
    }

    std::string path_of(const std::string& name) const { return path_ + '/' + name; }

    // Returns the path of the file.
    std::string write(const std::string& name, const std::string& bytes) const {
        std::string path = path_of(name);
        std::ofstream file(path, std::ios::binary);
        if (!(file << bytes).flush()) {
            throw std::runtime_error("cannot write " + path);
        }
        return path;
    }

  private:
    std::string path_;
};

// A folder that is the current one for as long as it lives.
class CurrentFolder : public TemporaryFolder {
  public:
    CurrentFolder() { std::filesystem::current_path(path_of("")); }
    CurrentFolder(const CurrentFolder&) = delete;
    CurrentFolder& operator=(const CurrentFolder&) = delete;
    ~CurrentFolder() {
        std::error_code ignored;
        std::filesystem::current_path(before_, ignored);
    }

  private:
    std::filesystem::path before_ = std::filesystem::current_path();
};
