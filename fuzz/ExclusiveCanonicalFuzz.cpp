// Differential fuzzing of the layer's exclusive canonicalisation, which digests untrusted tokens:
// for parsed input, every subtree the writer accepts must come out byte for byte as libxml2's
// C14N writes it, with and without inclusive prefixes, comments and an excluded child. A
// difference aborts (a finding), as does any crash or sanitizer report.

#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <string>
#include <vector>

#include <libxml/tree.h>
#include <xmlsec/transforms.h>

#include "tamber/Stream.h"
#include "tamber/xml/LibXml.h"
#include "tamber/xml/SafeParse.h"
#include "tamber/xml/security/ExclusiveCanonicalWriter.h"
#include "tamber/xml/security/Signature.h"
#include "tamber/xml/security/SubtreeCanonicalization.h"

namespace {

using Tamber::Xml::Security::Canonicalization;

// Prefixes the seed tokens declare, so that listing them inclusively changes the output.
const char* const kPrefixLists[] = {"", "xsi", "saml2 ds xs"};
constexpr size_t kMaxSubtrees = 16;

xmlNodePtr FirstChildElement(xmlNodePtr node) {
  for (xmlNodePtr child = node->children; child != nullptr; child = child->next) {
    if (child->type == XML_ELEMENT_NODE) return child;
  }
  return nullptr;
}

void Compare(xmlNodePtr root, xmlNodePtr excluded, bool withComments, const std::string& prefixList) {
  std::string written;
  if (!Tamber::Xml::Security::WriteExclusiveCanonicalForm(root, excluded, withComments,
                                                          Tamber::Xml::Security::SplitPrefixList(prefixList), written)) {
    return;
  }
  const Canonicalization form{withComments ? xmlSecTransformExclC14NWithCommentsId : xmlSecTransformExclC14NId,
                              withComments, prefixList};
  std::string reference;
  try {
    reference = Tamber::Xml::Security::CanonicalizeSubtreeWithLibXml2(root, excluded, form);
  } catch (const Tamber::Xml::Security::XmlSecurityException&) {
    return;  // libxml2 refuses what lies outside the subtree too (relative namespaces anywhere)
  }
  if (written != reference) abort();
}

void CompareSubtrees(xmlNodePtr node, size_t& budget) {
  for (; node != nullptr && budget > 0; node = node->next) {
    if (node->type != XML_ELEMENT_NODE) continue;
    --budget;
    for (const char* prefixList : kPrefixLists) {
      Compare(node, nullptr, false, prefixList);
      Compare(node, FirstChildElement(node), false, prefixList);
    }
    Compare(node, nullptr, true, "");
    CompareSubtrees(node->children, budget);
  }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  Tamber::Ref<Tamber::Reader> reader;
  Tamber::CreateStringReader(std::string(reinterpret_cast<const char*>(data), size), reader);
  Tamber::Ref<Tamber::Xml::Document> document;
  try {
    Tamber::Xml::ParseUntrustedXml(reader.get(), document);
  } catch (const Tamber::Xml::XMLParseException&) {
    return 0;
  }
  size_t budget = kMaxSubtrees;
  if (Tamber::Xml::ElementNode* root = document->GetRootElement()) {
    CompareSubtrees(Tamber::Xml::ToXmlNode(root), budget);
  }
  return 0;
}
