#include "tamber/Stream.h"

#include <algorithm>
#include <cstring>

namespace Tamber {

namespace {

class StringReaderImpl : public Reader {
 public:
  explicit StringReaderImpl(const std::string& text) : _text(text) {}

  size_t Read(char* buffer, size_t size) override {
    const size_t count = std::min(size, _text.size() - _position);
    std::memcpy(buffer, _text.data() + _position, count);
    _position += count;
    return count;
  }

 private:
  const std::string _text;
  size_t _position = 0;
};

class StringWriterImpl : public StringWriter {
 public:
  using StringWriter::Write;
  void Write(const char* data, size_t size) override { _text.append(data, size); }
  const std::string& GetString() const override { return _text; }

 private:
  std::string _text;
};

}  // namespace

void CreateStringReader(const std::string& text, Ref<Reader>& reader) {
  reader = new StringReaderImpl(text);
}

void CreateStringWriter(Ref<StringWriter>& writer) { writer = new StringWriterImpl(); }

}  // namespace Tamber
