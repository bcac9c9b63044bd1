#include "tamber/xml/security/ExclusiveCanonicalWriter.h"

#include <algorithm>
#include <vector>

#include "tamber/xml/security/Ids.h"

namespace Tamber {
namespace Xml {
namespace Security {

namespace {

const xmlChar kEmpty[] = "";

const xmlChar* OrEmpty(const xmlChar* text) { return text != nullptr ? text : kEmpty; }

void Append(std::string& out, const xmlChar* text) { out += reinterpret_cast<const char*>(OrEmpty(text)); }

void AppendQName(std::string& out, xmlNsPtr ns, const xmlChar* name) {
  if (ns != nullptr && ns->prefix != nullptr) {
    Append(out, ns->prefix);
    out += ':';
  }
  Append(out, name);
}

// The escape of a character in canonical text (`attribute` false) or attribute values, or null
// when it stands for itself: text escapes &, <, > and carriage returns; attribute values &, <, ",
// tab, line feed and carriage return.
const char* EscapeOf(xmlChar c, bool attribute) {
  switch (c) {
    case '&': return "&amp;";
    case '<': return "&lt;";
    case '>': return attribute ? nullptr : "&gt;";
    case '"': return attribute ? "&quot;" : nullptr;
    case '\t': return attribute ? "&#x9;" : nullptr;
    case '\n': return attribute ? "&#xA;" : nullptr;
    case '\r': return "&#xD;";
    default: return nullptr;
  }
}

void AppendEscaped(std::string& out, const xmlChar* text, bool attribute) {
  const xmlChar* run = OrEmpty(text);  // the start of characters not yet appended
  for (const xmlChar* c = run; *c != 0; ++c) {
    if (const char* escape = EscapeOf(*c, attribute)) {
      out.append(reinterpret_cast<const char*>(run), static_cast<size_t>(c - run));
      out += escape;
      run = c + 1;
    }
  }
  out += reinterpret_cast<const char*>(run);
}

bool IsAsciiLetter(xmlChar c) { return (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z'); }

// A namespace URI is written as it stands when it is absolute (libxml2 refuses relative ones) and
// holds only printable ASCII that needs no escaping (libxml2 refuses what is no URI, and quotes
// the rest its own way). Anything else is left to libxml2.
bool IsPlainAbsoluteUri(const xmlChar* uri) {
  if (uri == nullptr || *uri == 0) return true;  // no namespace
  if (!IsAsciiLetter(*uri)) return false;
  const xmlChar* c = uri + 1;
  while (IsAsciiLetter(*c) || (*c >= '0' && *c <= '9') || *c == '+' || *c == '-' || *c == '.') ++c;
  if (*c != ':') return false;
  for (; *c != 0; ++c) {
    if (*c <= 0x20 || *c >= 0x7F || *c == '"' || *c == '&' || *c == '<' || *c == '>') return false;
  }
  return true;
}

bool IsXmlNamespace(xmlNsPtr ns) { return xmlStrEqual(ns->href, XML_XML_NAMESPACE); }

struct NamespaceNode {
  const xmlChar* prefix;  // "" for the default namespace
  const xmlChar* uri;     // "" for no namespace
};

class Writer {
 public:
  Writer(xmlNodePtr excluded, bool keepComments, const std::vector<std::string>& inclusivePrefixes, std::string& out)
      : _excluded(excluded), _keepComments(keepComments), _inclusivePrefixes(inclusivePrefixes), _out(out) {}

  bool WriteElement(xmlNodePtr element) {
    for (xmlNsPtr declared = element->nsDef; declared != nullptr; declared = declared->next) {
      if (!IsPlainAbsoluteUri(declared->href)) return false;
    }
    const size_t outerScope = _rendered.size();
    _out += '<';
    AppendQName(_out, element->ns, element->name);
    if (!WriteNamespaces(element)) return false;
    WriteAttributes(element);
    _out += '>';
    for (xmlNodePtr child = element->children; child != nullptr; child = child->next) {
      if (!WriteChild(child)) return false;
    }
    _out += "</";
    AppendQName(_out, element->ns, element->name);
    _out += '>';
    _rendered.resize(outerScope);
    return true;
  }

 private:
  bool WriteChild(xmlNodePtr node) {
    switch (node->type) {
      case XML_ELEMENT_NODE:
        return node == _excluded || WriteElement(node);
      case XML_TEXT_NODE:
      case XML_CDATA_SECTION_NODE:
        AppendEscaped(_out, node->content, false);
        return true;
      case XML_COMMENT_NODE:
        if (_keepComments) {
          _out += "<!--";
          Append(_out, node->content);
          _out += "-->";
        }
        return true;
      case XML_PI_NODE:
        _out += "<?";
        Append(_out, node->name);
        if (node->content != nullptr && *node->content != 0) {
          _out += ' ';
          Append(_out, node->content);
        }
        _out += "?>";
        return true;
      default:
        return false;
    }
  }

  // The namespace URI the nearest output ancestor declared for `prefix`; null when none did.
  const xmlChar* InEffect(const xmlChar* prefix) const {
    for (auto node = _rendered.rbegin(); node != _rendered.rend(); ++node) {
      if (xmlStrEqual(node->prefix, prefix)) return node->uri;
    }
    return nullptr;
  }

  // A namespace the element or one of its attributes uses, or one in scope whose prefix is listed
  // as inclusive, is declared unless an output ancestor declared it already; an unqualified
  // element undeclares a default namespace it would inherit. The xml prefix is never declared.
  void Utilize(xmlNsPtr ns) {
    if (ns != nullptr && IsXmlNamespace(ns)) return;
    NamespaceNode node{ns != nullptr ? OrEmpty(ns->prefix) : kEmpty, ns != nullptr ? OrEmpty(ns->href) : kEmpty};
    for (const NamespaceNode& declared : _declarations) {
      if (xmlStrEqual(declared.prefix, node.prefix)) return;
    }
    const xmlChar* inEffect = InEffect(node.prefix);
    if (inEffect == nullptr ? *node.uri == 0 : xmlStrEqual(inEffect, node.uri)) return;
    _declarations.push_back(node);
  }

  bool WriteNamespaces(xmlNodePtr element) {
    _declarations.clear();
    // An unqualified element uses the default namespace in scope: in a parsed tree an undeclaration,
    // in a built one possibly a declaration its serialisation will put it under.
    Utilize(element->ns != nullptr ? element->ns : xmlSearchNs(element->doc, element, nullptr));
    for (xmlAttrPtr attribute = element->properties; attribute != nullptr; attribute = attribute->next) {
      if (attribute->ns != nullptr) Utilize(attribute->ns);
    }
    for (const std::string& prefix : _inclusivePrefixes) {
      if (xmlNsPtr inScope = xmlSearchNs(element->doc, element, BAD_CAST prefix.c_str())) Utilize(inScope);
    }
    std::sort(_declarations.begin(), _declarations.end(), [](const NamespaceNode& a, const NamespaceNode& b) {
      return xmlStrcmp(a.prefix, b.prefix) < 0;
    });
    for (const NamespaceNode& declaration : _declarations) {
      if (!IsPlainAbsoluteUri(declaration.uri)) return false;
      _out += " xmlns";
      if (*declaration.prefix != 0) {
        _out += ':';
        Append(_out, declaration.prefix);
      }
      _out += "=\"";
      Append(_out, declaration.uri);
      _out += '"';
      _rendered.push_back(declaration);
    }
    return true;
  }

  // Sorted by namespace URI (unqualified first), then by local name.
  void WriteAttributes(xmlNodePtr element) {
    _attributes.clear();
    for (xmlAttrPtr attribute = element->properties; attribute != nullptr; attribute = attribute->next) {
      _attributes.push_back(attribute);
    }
    std::sort(_attributes.begin(), _attributes.end(), [](xmlAttrPtr a, xmlAttrPtr b) {
      int byNamespace = xmlStrcmp(a->ns != nullptr ? a->ns->href : nullptr, b->ns != nullptr ? b->ns->href : nullptr);
      return byNamespace != 0 ? byNamespace < 0 : xmlStrcmp(a->name, b->name) < 0;
    });
    for (xmlAttrPtr attribute : _attributes) {
      _out += ' ';
      AppendQName(_out, attribute->ns, attribute->name);
      _out += "=\"";
      xmlNodePtr value = attribute->children;
      if (value != nullptr && value->next == nullptr && value->type == XML_TEXT_NODE) {
        AppendEscaped(_out, value->content, true);  // as parsed: one text node
      } else {
        AppendEscaped(_out, BAD_CAST GetAttributeValue(attribute).c_str(), true);
      }
      _out += '"';
    }
  }

  xmlNodePtr const _excluded;
  const bool _keepComments;
  const std::vector<std::string>& _inclusivePrefixes;
  std::string& _out;
  std::vector<NamespaceNode> _rendered;  // declarations of the output ancestors, innermost last
  // Scratch space of the element being written, reused (its children are written afterwards).
  std::vector<NamespaceNode> _declarations;
  std::vector<xmlAttrPtr> _attributes;
};

}  // namespace

bool WriteExclusiveCanonicalForm(xmlNodePtr root, xmlNodePtr excluded, bool keepComments,
                                 const std::vector<std::string>& inclusivePrefixes, std::string& out) {
  for (const std::string& prefix : inclusivePrefixes) {
    if (prefix == "#default") return false;  // the default namespace as inclusive: libxml2's rules
  }
  if (root == excluded) return true;
  Writer writer(excluded, keepComments, inclusivePrefixes, out);
  return writer.WriteElement(root);
}

}  // namespace Security
}  // namespace Xml
}  // namespace Tamber
