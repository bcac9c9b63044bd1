#ifndef TAMBER_XML_QNAME_H
#define TAMBER_XML_QNAME_H

#include <string>

#include "tamber/Export.h"

namespace Tamber {
namespace Xml {

// A namespace URI and a local name, compared member-wise.
class TAMBER_API QName {
 public:
  QName() = default;
  QName(const std::string& namespaceUri, const std::string& localName)
      : _namespace(namespaceUri), _localName(localName) {}

  const std::string& GetNamespace() const { return _namespace; }
  const std::string& GetLocalName() const { return _localName; }
  // The local name alone when the namespace is empty, else namespace + ":" + local name.
  std::string ToString() const { return _namespace.empty() ? _localName : _namespace + ":" + _localName; }

  bool operator==(const QName& other) const {
    return _namespace == other._namespace && _localName == other._localName;
  }
  bool operator!=(const QName& other) const { return !(*this == other); }
  bool operator<(const QName& other) const {
    return _namespace != other._namespace ? _namespace < other._namespace : _localName < other._localName;
  }

 private:
  std::string _namespace;
  std::string _localName;
};

}  // namespace Xml
}  // namespace Tamber

#endif
