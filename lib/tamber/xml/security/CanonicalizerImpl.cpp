#include "tamber/xml/LibXml.h"
#include "tamber/xml/security/Algorithms.h"
#include "tamber/xml/security/Canonicalizer.h"
#include "tamber/xml/security/Signature.h"
#include "tamber/xml/security/SubtreeCanonicalization.h"

namespace Tamber {
namespace Xml {
namespace Security {

namespace {

class CanonicalizerImpl final : public Canonicalizer {
 public:
  explicit CanonicalizerImpl(xmlSecTransformId algorithm) : _algorithm(algorithm) {}

  void Canonicalize(const ElementNode* element, Writer* writer) const override {
    if (element == nullptr || writer == nullptr) throw InvalidArgumentException("Canonicalize needs an element and a writer");
    EnsureLibXmlInitialized();
    // A built tree may still hold names whose declarations were added later.
    ResolvePendingNamespaces(const_cast<ElementNode*>(element));
    // Made first, so that the writer (which may throw) is never called from inside libxml2.
    const std::string text = CanonicalizeSubtree(ToXmlNode(element), nullptr, {_algorithm, true, ""});
    writer->Write(text);
  }

 private:
  const xmlSecTransformId _algorithm;
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
