// A directory for the files of one test, gone afterwards.
#pragma once

#include <stdint.h>
#include <stdlib.h>

#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>
#include <string_view>
#include <vector>

namespace tooltest {

class TemporaryDirectory {
 public:
  TemporaryDirectory() {
    std::string name = (std::filesystem::temp_directory_path() / "omxbridge.XXXXXX").string();
    _path = mkdtemp(name.data()) != nullptr ? name : std::string();
  }
  ~TemporaryDirectory() {
    if (!_path.empty()) std::filesystem::remove_all(_path);
  }
  TemporaryDirectory(const TemporaryDirectory&) = delete;
  TemporaryDirectory& operator=(const TemporaryDirectory&) = delete;

  std::string file(std::string_view name) const { return _path + "/" + std::string(name); }

  // Writes a file and returns its path.
  std::string write(std::string_view name, std::string_view content) const {
    std::ofstream(file(name), std::ios::binary) << content;
    return file(name);
  }

  std::vector<std::string> names() const {
    std::vector<std::string> names;
    for (const auto& entry : std::filesystem::directory_iterator(_path)) {
      names.push_back(entry.path().filename().string());
    }
    return names;
  }

 private:
  std::string _path;
};

inline std::string contentOf(const std::string& path) {
  std::ifstream file(path, std::ios::binary);
  return {std::istreambuf_iterator<char>(file), {}};
}

}  // namespace tooltest
