#include <libxml/c14n.h>
#include <libxml/xmlIO.h>

#include "tamber/xml/LibXml.h"
#include "tamber/xml/security/Algorithms.h"
#include "tamber/xml/security/Canonicalizer.h"
#include "tamber/xml/security/Signature.h"

namespace Tamber {
namespace Xml {
namespace Security {

namespace {

bool IsInSubtree(xmlNodePtr node, xmlNodePtr root) {
  for (; node != nullptr; node = node->parent) {
    if (node == root) return true;
  }
  return false;
}

// The node set of the subtree: the element, its descendants, their attributes and the namespace
// nodes of all of them. An invisible ancestor's declarations still reach the element (inclusive
// form), as its namespace nodes.
int IsVisibleInSubtree(void* root, xmlNodePtr node, xmlNodePtr parent) {
  bool ownedByElement = node->type == XML_NAMESPACE_DECL || node->type == XML_ATTRIBUTE_NODE;
  return IsInSubtree(ownedByElement ? parent : node, static_cast<xmlNodePtr>(root)) ? 1 : 0;
}

int AppendToString(void* context, const char* buffer, int length) {
  static_cast<std::string*>(context)->append(buffer, static_cast<size_t>(length));
  return length;
}

class CanonicalizerImpl final : public Canonicalizer {
 public:
  explicit CanonicalizerImpl(xmlSecTransformId algorithm)
      : _mode(IsExclusiveCanonicalization(algorithm) ? XML_C14N_EXCLUSIVE_1_0 : XML_C14N_1_0),
        _withComments(CanonicalizationKeepsComments(algorithm)) {}

  void Canonicalize(const ElementNode* element, Writer* writer) const override {
    if (element == nullptr || writer == nullptr) throw InvalidArgumentException("Canonicalize needs an element and a writer");
    EnsureLibXmlInitialized();
    // A built tree may still hold names whose declarations were added later.
    ResolvePendingNamespaces(const_cast<ElementNode*>(element));
    xmlNodePtr node = ToXmlNode(element);
    // Collected first, so that the writer (which may throw) is never called from inside libxml2.
    std::string text;
    ScopedXmlErrorCapture errors;
    xmlOutputBufferPtr output = xmlOutputBufferCreateIO(&AppendToString, nullptr, &text, nullptr);
    if (output == nullptr) throw XmlSecurityException("Canonicalization failed: out of memory");
    int result = xmlC14NExecute(node->doc, &IsVisibleInSubtree, node, _mode, nullptr, _withComments ? 1 : 0, output);
    int closed = xmlOutputBufferClose(output);
    if (result < 0 || closed < 0) {
      throw XmlSecurityException("Canonicalization failed: " +
                                 (errors.HasError() ? errors.GetFirstError() : std::string("unknown error")));
    }
    writer->Write(text);
  }

 private:
  const int _mode;
  const bool _withComments;
};

}  // namespace

void CreateCanonicalizer(const std::string& algorithmUri, Ref<Canonicalizer>& canonicalizer) {
  xmlSecTransformId algorithm = FindCanonicalizationMethod(algorithmUri);
  if (algorithm == xmlSecTransformIdUnknown) {
    throw InvalidArgumentException("Unsupported canonicalization algorithm \"" + algorithmUri + "\"");
  }
  canonicalizer = new CanonicalizerImpl(algorithm);
}

}  // namespace Security
}  // namespace Xml
}  // namespace Tamber
