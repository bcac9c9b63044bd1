#include "tamber/Exception.h"

#include <cxxabi.h>
#include <dlfcn.h>
#include <execinfo.h>

#include <cstdio>
#include <cstdlib>
#include <memory>

namespace Tamber {

namespace {

// Deep enough to reach the application from any point of the library.
constexpr int kMaxFrames = 32;

std::string Demangle(const char* name) {
  int status = 0;
  std::unique_ptr<char, void (*)(void*)> demangled(abi::__cxa_demangle(name, nullptr, nullptr, &status),
                                                    std::free);
  return status == 0 && demangled ? std::string(demangled.get()) : std::string(name);
}

struct Frame {
  std::string function;  // demangled; empty when the symbol is not exported
  std::string text;      // one line of the backtrace
};

Frame Symbolise(void* address) {
  Frame frame;
  char where[64];
  std::snprintf(where, sizeof where, "[%p]", address);
  Dl_info info{};
  if (dladdr(address, &info) == 0) {
    frame.text = std::string("?? ") + where;
    return frame;
  }
  const char* module = info.dli_fname ? info.dli_fname : "??";
  char offset[32];
  if (info.dli_sname != nullptr) {
    frame.function = Demangle(info.dli_sname);
    std::snprintf(offset, sizeof offset, "+0x%zx",
                  static_cast<size_t>(static_cast<char*>(address) - static_cast<char*>(info.dli_saddr)));
    frame.text = frame.function + offset + " (" + module + ") " + where;
  } else {
    std::snprintf(offset, sizeof offset, "+0x%zx",
                  static_cast<size_t>(static_cast<char*>(address) - static_cast<char*>(info.dli_fbase)));
    frame.text = std::string("?? (") + module + offset + ") " + where;
  }
  return frame;
}

bool EndsWith(const std::string& text, const std::string& suffix) {
  return text.size() >= suffix.size() && text.compare(text.size() - suffix.size(), suffix.size(), suffix) == 0;
}

// Frames that raise exceptions rather than report a fault: the constructors of exception classes,
// their Throw() and the throw helpers.
bool IsExceptionMachinery(const std::string& function) {
  const size_t paren = function.find('(');
  const std::string name = function.substr(0, paren);
  if (name.rfind("Tamber::Throwable::", 0) == 0 || name.rfind("Tamber::Detail::Throw", 0) == 0) return true;
  if (EndsWith(name, "::Throw")) return true;
  const size_t separator = name.rfind("::");
  if (separator == std::string::npos) return false;
  const std::string member = name.substr(separator + 2);
  const std::string owner = name.substr(0, separator);
  const bool isConstructor = EndsWith(owner, "::" + member) || owner == member;
  return isConstructor && (EndsWith(member, "Exception") || member == "Throwable");
}

}  // namespace

Throwable::Throwable(const std::string& message) : _message(message) {
  void* frames[kMaxFrames];
  const int count = backtrace(frames, kMaxFrames);
  _frames.assign(frames, frames + count);
}

Throwable::~Throwable() = default;

const char* Throwable::what() const noexcept { return _message.c_str(); }

std::string Throwable::GetBacktrace() const {
  std::string result;
  for (size_t i = 0; i < _frames.size(); ++i) {
    result += "#" + std::to_string(i) + " " + Symbolise(_frames[i]).text + "\n";
  }
  return result;
}

std::string Throwable::Dump() const {
  return Demangle(typeid(*this).name()) + ": " + _message + "\n" + GetBacktrace();
}

std::string Throwable::Where() const {
  // Frame 0 is this constructor; without symbol names the frame after it is the best guess.
  for (size_t i = 1; i < _frames.size(); ++i) {
    Frame frame = Symbolise(_frames[i]);
    if (frame.function.empty() || !IsExceptionMachinery(frame.function)) return frame.text;
  }
  return std::string();
}

Exception::Exception(const std::string& message) : Throwable(message) {}

Exception* Exception::Clone() const { return new Exception(*this); }

void Exception::Throw() const { throw *this; }

InvalidArgumentException::InvalidArgumentException(const std::string& message)
    : Exception("Invalid argument : " + message) {}

// The copy keeps the prefixed text as it stands.
InvalidArgumentException* InvalidArgumentException::Clone() const { return new InvalidArgumentException(*this); }

void InvalidArgumentException::Throw() const { throw *this; }

namespace Detail {

void ThrowTypeMismatch(const char* expected, const char* found) {
  throw TypeMismatchException("Type mismatch: expected " + Demangle(expected) + ", found " + Demangle(found));
}

}  // namespace Detail

}  // namespace Tamber
