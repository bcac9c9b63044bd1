#ifndef TAMBER_MESSAGEFORMATTER_H
#define TAMBER_MESSAGEFORMATTER_H

#include <cstdint>
#include <string>

#include "tamber/Export.h"
#include "tamber/system/DateTime.h"

namespace Tamber {
namespace MessageFormatter {

// One argument of a formatted message, already turned into text. Strings and integers convert
// implicitly; Booleans and dates go through BoolPrintFormatter and DatePrintFormatter, so that a
// pointer never turns into a Boolean by accident.
class TAMBER_API PrintFormatter {
 public:
  // Text as it stands (a null C string as empty text), integers in decimal; Booleans only
  // through BoolPrintFormatter.
  PrintFormatter(const std::string& text) : _text(text) {}
  PrintFormatter(const char* text) : _text(text ? text : "") {}
  PrintFormatter(int value) : _text(std::to_string(value)) {}
  PrintFormatter(unsigned value) : _text(std::to_string(value)) {}
  PrintFormatter(long value) : _text(std::to_string(value)) {}
  PrintFormatter(unsigned long value) : _text(std::to_string(value)) {}
  PrintFormatter(long long value) : _text(std::to_string(value)) {}
  PrintFormatter(unsigned long long value) : _text(std::to_string(value)) {}
  PrintFormatter(bool) = delete;

  // The argument's text as it goes into the message.
  const std::string& GetText() const { return _text; }

 protected:
  struct Preformatted {};
  PrintFormatter(Preformatted, std::string text) : _text(std::move(text)) {}

 private:
  std::string _text;
};

// "true" or "false".
class TAMBER_API BoolPrintFormatter : public PrintFormatter {
 public:
  explicit BoolPrintFormatter(bool value) : PrintFormatter(Preformatted(), value ? "true" : "false") {}
};

// A date as System::DateTime::ToString writes it.
class TAMBER_API DatePrintFormatter : public PrintFormatter {
 public:
  explicit DatePrintFormatter(const System::DateTime& date)
      : PrintFormatter(Preformatted(), date.ToString()) {}
};

// Replaces %1 to %9 in `format` with the arguments' texts, each as often as it appears. A
// placeholder without an argument, and any other character, is copied unchanged; "%%" is copied
// as it stands. Argument texts are not scanned again.
TAMBER_API std::string ASPrintArray(const char* format, const PrintFormatter* const* arguments,
                                    size_t count);

// ASPrintArray over the arguments, each converted to a PrintFormatter.
template <class... Arguments>
std::string ASPrint(const char* format, const Arguments&... arguments) {
  const PrintFormatter converted[] = {PrintFormatter(arguments)..., PrintFormatter("")};
  const PrintFormatter* pointers[sizeof...(arguments) + 1];
  for (size_t i = 0; i <= sizeof...(arguments); ++i) pointers[i] = &converted[i];
  return ASPrintArray(format, pointers, sizeof...(arguments));
}

}  // namespace MessageFormatter
}  // namespace Tamber

#endif
