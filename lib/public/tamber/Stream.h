#ifndef TAMBER_STREAM_H
#define TAMBER_STREAM_H

#include <cstddef>
#include <string>

#include "tamber/Ref.h"

namespace Tamber {

// A source of bytes read front to back.
class TAMBER_API Reader : public Object {
 public:
  // Copies up to `size` bytes into `buffer` and returns how many; 0 means the end. Failures
  // raise IOException or a more specific exception of the source.
  virtual size_t Read(char* buffer, size_t size) = 0;
};

// A sink of bytes.
class TAMBER_API Writer : public Object {
 public:
  // Appends `size` bytes of `data`.
  virtual void Write(const char* data, size_t size) = 0;
  void Write(const std::string& text) { Write(text.data(), text.size()); }
};

// A writer that collects what is written into a string.
class TAMBER_API StringWriter : public Writer {
 public:
  using Writer::Write;
  // Everything written so far.
  virtual const std::string& GetString() const = 0;
};

// A reader over a copy of `text`.
TAMBER_API void CreateStringReader(const std::string& text, Ref<Reader>& reader);
// A new, empty string writer.
TAMBER_API void CreateStringWriter(Ref<StringWriter>& writer);

}  // namespace Tamber

#endif
