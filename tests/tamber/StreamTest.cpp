#include "tamber/Stream.h"

#include <gtest/gtest.h>

namespace {

TEST(StreamTest, StringReaderDeliversTheTextInChunksThenEnds) {
  std::string text = "0123456789";
  Tamber::Ref<Tamber::Reader> reader;
  Tamber::CreateStringReader(text, reader);
  text = "changed";  // the reader keeps its own copy
  char buffer[4];
  std::string read;
  for (size_t count; (count = reader->Read(buffer, sizeof buffer)) != 0;) read.append(buffer, count);
  EXPECT_EQ(read, "0123456789");
  EXPECT_EQ(reader->Read(buffer, sizeof buffer), 0u);
}

TEST(StreamTest, StringWriterCollectsBinaryText) {
  Tamber::Ref<Tamber::StringWriter> writer;
  Tamber::CreateStringWriter(writer);
  EXPECT_EQ(writer->GetString(), "");
  writer->Write("ab");
  writer->Write(std::string("\0c", 2));
  writer->Write("xyz", 0);
  EXPECT_EQ(writer->GetString(), std::string("ab\0c", 4));
}

}  // namespace
