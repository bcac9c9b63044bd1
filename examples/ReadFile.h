#ifndef EXAMPLES_READFILE_H
#define EXAMPLES_READFILE_H

#include <fstream>
#include <sstream>
#include <stdexcept>
#include <string>

// The whole of a file; a file that cannot be read is an error rather than empty text, so that a
// mistyped path never turns into "trust nothing" or "trust the system store".
inline std::string ReadFile(const std::string& path) {
  std::ifstream in(path, std::ios::binary);
  if (!in) throw std::runtime_error("cannot read " + path);
  std::ostringstream content;
  content << in.rdbuf();
  return content.str();
}

#endif
