#ifndef TAMBER_EXCEPTION_H
#define TAMBER_EXCEPTION_H

#include <exception>
#include <string>
#include <typeinfo>
#include <vector>

#include "tamber/Export.h"

namespace Tamber {

// Root of the layer's exceptions: a UTF-8 message and the call stack where it was raised.
class TAMBER_API Throwable : public std::exception {
 public:
  // Captures the call stack; `message` is UTF-8 text saying what was expected and found.
  explicit Throwable(const std::string& message);
  ~Throwable() override;

  // The message given at construction.
  const char* what() const noexcept override;
  // The call stack at construction, one frame per line, symbolised on demand.
  std::string GetBacktrace() const;
  // Class name, message and backtrace, for diagnostics.
  std::string Dump() const;
  // The innermost frame of the backtrace that lies outside the exception machinery.
  std::string Where() const;

 private:
  std::string _message;
  std::vector<void*> _frames;
};

// Exceptions that can be copied and rethrown with their dynamic type, so that they can cross
// threads (an asynchronous completion keeps Clone() and later calls Throw()).
class TAMBER_API Exception : public Throwable {
 public:
  explicit Exception(const std::string& message);
  // A heap copy of the same dynamic type; the caller owns it.
  virtual Exception* Clone() const;
  // Throws a copy of this exception as its own dynamic type.
  [[noreturn]] virtual void Throw() const;
};

}  // namespace Tamber

// Declares an exception class with the constructor from a message, Clone and Throw.
#define TAMBER_DECLARE_EXCEPTION(API, Name, Base)              \
  class API Name : public Base {                               \
   public:                                                     \
    explicit Name(const std::string& message) : Base(message) {} \
    Name* Clone() const override { return new Name(*this); }   \
    [[noreturn]] void Throw() const override { throw *this; }  \
  }

namespace Tamber {

// A broken precondition; the message is "Invalid argument : " followed by the given text.
class TAMBER_API InvalidArgumentException : public Exception {
 public:
  explicit InvalidArgumentException(const std::string& message);
  InvalidArgumentException* Clone() const override;
  [[noreturn]] void Throw() const override;
};

// An operation called in a state or configuration that cannot serve it.
TAMBER_DECLARE_EXCEPTION(TAMBER_API, InvalidStateException, Exception);
// An object was not of the type its use requires (see DynamicCast).
TAMBER_DECLARE_EXCEPTION(TAMBER_API, TypeMismatchException, Exception);
// Text that is not an xs:dateTime; the message quotes the text.
TAMBER_DECLARE_EXCEPTION(TAMBER_API, DateTimeFormatException, Exception);
// Text that is not standard base64.
TAMBER_DECLARE_EXCEPTION(TAMBER_API, Base64FormatException, Exception);
// Reading or writing a stream failed.
TAMBER_DECLARE_EXCEPTION(TAMBER_API, IOException, Exception);

// Casts to a derived type, raising TypeMismatchException (naming both types) when the object is
// of another type. A null pointer stays null.
template <class To, class From>
To* DynamicCast(From* object);

namespace Detail {
// Raises TypeMismatchException naming both types; DynamicCast's failure path.
[[noreturn]] TAMBER_API void ThrowTypeMismatch(const char* expected, const char* found);
}

template <class To, class From>
To* DynamicCast(From* object) {
  if (object == nullptr) return nullptr;
  To* result = dynamic_cast<To*>(object);
  if (result == nullptr) Detail::ThrowTypeMismatch(typeid(To).name(), typeid(*object).name());
  return result;
}

}  // namespace Tamber

#endif
