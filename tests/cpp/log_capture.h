// Collects the engine's log lines during a test.
#pragma once

#include <string>
#include <vector>

#include "effect/kalo/px_log.h"

class LogCapture {
 public:
  LogCapture() {
    lines().clear();
    px_log_set_sink([](int, const char* tag, const char* text) { lines().push_back(std::string(tag) + "|" + text); });
  }
  ~LogCapture() { px_log_set_sink(nullptr); }
  const std::vector<std::string>& all() const { return lines(); }
  bool contains(const std::string& piece) const {
    for (const auto& l : lines()) {
      if (l.find(piece) != std::string::npos) return true;
    }
    return false;
  }

 private:
  static std::vector<std::string>& lines() {
    static std::vector<std::string> v;
    return v;
  }
};
