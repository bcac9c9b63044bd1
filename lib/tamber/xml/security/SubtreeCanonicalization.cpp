#include "tamber/xml/security/SubtreeCanonicalization.h"

#include <algorithm>
#include <vector>

#include <boost/algorithm/string/classification.hpp>
#include <boost/algorithm/string/split.hpp>
#include <libxml/c14n.h>
#include <libxml/xmlIO.h>
#include <xmlsec/strings.h>
#include <xmlsec/xmltree.h>

#include "tamber/xml/LibXml.h"
#include "tamber/xml/security/Algorithms.h"
#include "tamber/xml/security/ExclusiveCanonicalWriter.h"
#include "tamber/xml/security/Signature.h"

namespace Tamber {
namespace Xml {
namespace Security {

namespace {

struct NodeSet {
  xmlNodePtr root;
  xmlNodePtr excluded;
};

bool IsInSubtree(xmlNodePtr node, xmlNodePtr root) {
  for (; node != nullptr; node = node->parent) {
    if (node == root) return true;
  }
  return false;
}

// An invisible ancestor's declarations still reach the root (inclusive form), as its namespace
// nodes: attributes and namespace nodes belong where their element does.
int IsVisible(void* set, xmlNodePtr node, xmlNodePtr parent) {
  const auto* nodes = static_cast<const NodeSet*>(set);
  xmlNodePtr owner = node->type == XML_NAMESPACE_DECL || node->type == XML_ATTRIBUTE_NODE ? parent : node;
  if (!IsInSubtree(owner, nodes->root)) return 0;
  return nodes->excluded == nullptr || !IsInSubtree(owner, nodes->excluded) ? 1 : 0;
}

int AppendToString(void* context, const char* buffer, int length) {
  static_cast<std::string*>(context)->append(buffer, static_cast<size_t>(length));
  return length;
}

}  // namespace

std::vector<std::string> SplitPrefixList(const std::string& list) {
  std::vector<std::string> prefixes;
  boost::split(prefixes, list, boost::is_any_of(" \t\r\n"), boost::token_compress_on);
  prefixes.erase(std::remove(prefixes.begin(), prefixes.end(), std::string()), prefixes.end());
  return prefixes;
}

std::string CanonicalizeSubtreeWithLibXml2(xmlNodePtr root, xmlNodePtr excluded, const Canonicalization& form) {
  NodeSet nodes{root, excluded};
  const bool exclusive = IsExclusiveCanonicalization(form.algorithm);
  const int mode = exclusive ? XML_C14N_EXCLUSIVE_1_0 : XML_C14N_1_0;
  const int withComments = form.keepComments && CanonicalizationKeepsComments(form.algorithm) ? 1 : 0;
  std::vector<std::string> prefixes;
  if (exclusive) prefixes = SplitPrefixList(form.inclusivePrefixes);
  std::vector<xmlChar*> prefixList;
  for (std::string& prefix : prefixes) prefixList.push_back(BAD_CAST &prefix[0]);
  prefixList.push_back(nullptr);
  std::string text;
  ScopedXmlErrorCapture errors;
  xmlOutputBufferPtr output = xmlOutputBufferCreateIO(&AppendToString, nullptr, &text, nullptr);
  if (output == nullptr) throw XmlSecurityException("Canonicalization failed: out of memory");
  int result = xmlC14NExecute(root->doc, &IsVisible, &nodes, mode, prefixList.size() > 1 ? prefixList.data() : nullptr,
                              withComments, output);
  int closed = xmlOutputBufferClose(output);
  if (result < 0 || closed < 0) {
    throw XmlSecurityException("Canonicalization failed: " +
                               (errors.HasError() ? errors.GetFirstError() : std::string("unknown error")));
  }
  return text;
}

std::string CanonicalizeSubtree(xmlNodePtr root, xmlNodePtr excluded, const Canonicalization& form) {
  if (IsExclusiveCanonicalization(form.algorithm)) {
    std::string text;
    const bool withComments = form.keepComments && CanonicalizationKeepsComments(form.algorithm);
    if (WriteExclusiveCanonicalForm(root, excluded, withComments, SplitPrefixList(form.inclusivePrefixes), text)) {
      return text;
    }
  }
  return CanonicalizeSubtreeWithLibXml2(root, excluded, form);
}

std::string InclusivePrefixesOf(xmlNodePtr method) {
  for (const xmlChar* ns : {xmlSecNsExcC14N, xmlSecNsExcC14NWithComments}) {
    if (xmlNodePtr inclusive = xmlSecFindChild(method, xmlSecNodeInclusiveNamespaces, ns)) {
      xmlChar* list = xmlGetProp(inclusive, xmlSecAttrPrefixList);
      std::string prefixes = list != nullptr ? reinterpret_cast<const char*>(list) : "";
      xmlFree(list);
      return prefixes;
    }
  }
  return "";
}

}  // namespace Security
}  // namespace Xml
}  // namespace Tamber
