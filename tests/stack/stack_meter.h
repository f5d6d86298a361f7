// How deep calls go: each runs on a stack that is painted, and the deepest byte that lost its paint
// tells how much was used. Below the stack lies a page that nobody may touch.
#ifndef KESTREL_TESTS_STACK_STACK_METER_H
#define KESTREL_TESTS_STACK_STACK_METER_H

#include <cstddef>
#include <functional>
#include <map>
#include <string>

namespace stack {

// What camera threads can spare.
constexpr size_t kLimit = 64 << 10;

// Bytes of stack that a call uses, on a thread of its own. SIZE_MAX, and the test fails, when there
// is no such thread.
size_t UseOf(const std::function<void()>& body);

// The deepest of each kind of calls; says them when it goes.
class Deepest {
 public:
  Deepest() = default;
  ~Deepest();
  Deepest(const Deepest&) = delete;
  Deepest& operator=(const Deepest&) = delete;

  // Measures a call of a kind; the test fails when it goes beyond the limit. `which` says which of
  // its kind it was. Returns what it used.
  size_t Measure(const std::string& kind, const std::string& which,
                 const std::function<void()>& call);

 private:
  struct Use {
    size_t bytes = 0;
    std::string which;
    int calls = 0;
  };
  std::map<std::string, Use> kinds_;
};

}  // namespace stack

#endif
