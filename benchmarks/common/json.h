// Just enough JSON for results.
#ifndef KESTREL_BENCHMARKS_COMMON_JSON_H
#define KESTREL_BENCHMARKS_COMMON_JSON_H

#include <cstdio>
#include <string>

namespace bench {

class Json {
 public:
  Json& Open(char bracket) {
    Separate();
    text_ += bracket;
    first_ = true;
    return *this;
  }
  Json& Close(char bracket) {
    text_ += bracket;
    first_ = false;
    return *this;
  }
  Json& Key(const std::string& key) {
    Separate();
    text_ += Quoted(key) + ": ";
    first_ = true;
    return *this;
  }
  Json& Value(const std::string& value) { return Raw(Quoted(value)); }
  Json& Value(const char* value) { return Raw(Quoted(value)); }
  Json& Value(double value) {
    char number[32];
    std::snprintf(number, sizeof(number), "%.9g", value);
    return Raw(number);
  }
  template <typename T>
  Json& Entry(const std::string& key, const T& value) {
    return Key(key).Value(value);
  }

  // False, with a message, when the file cannot be written.
  bool Write(const std::string& path) const {
    std::FILE* file = std::fopen(path.c_str(), "w");
    bool done = file != nullptr && std::fputs(text_.c_str(), file) >= 0;
    if (file != nullptr && std::fclose(file) != 0) done = false;
    if (!done) std::perror(path.c_str());
    return done;
  }

 private:
  static std::string Quoted(const std::string& text) {
    std::string quoted = "\"";
    for (const char c : text) {
      if (c == '"' || c == '\\') quoted += '\\';
      quoted += c >= 0 && c < ' ' ? ' ' : c;
    }
    return quoted + '"';
  }
  Json& Raw(const std::string& value) {
    Separate();
    text_ += value;
    return *this;
  }
  void Separate() {
    if (!first_) text_ += ",\n";
    first_ = false;
  }

  std::string text_;
  bool first_ = true;
};

}  // namespace bench

#endif
