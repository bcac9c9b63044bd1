#ifndef SSOCLIENT_XMLUTILS_H
#define SSOCLIENT_XMLUTILS_H

// DOM walking and text helpers shared by every reader and builder of the library.

#include <string>

#include <boost/shared_ptr.hpp>

#include "tamber/Ref.h"
#include "tamber/Stream.h"
#include "tamber/system/DateTime.h"
#include "tamber/xml/Dom.h"
#include "tamber/xml/QName.h"

namespace SsoClient {

// Decides which nodes an iterator visits.
class NodeFilter {
 public:
  virtual bool Accept(Tamber::Xml::Node* node) const = 0;

 protected:
  ~NodeFilter() = default;
};

// Skips comments and text nodes made only of tab, line feed, carriage return and space.
class SkipWsAndCommentsFilter final : public NodeFilter {
 public:
  bool Accept(Tamber::Xml::Node* node) const override;
};

// Walks siblings and children, skipping what the filter rejects. Two words and a shared count;
// copy it freely. It does not own the node: the document does.
class NodeFilterIterator {
 public:
  // Positions the iterator on `node` as given (the filter is not applied to it).
  NodeFilterIterator(Tamber::Xml::Node* node, const boost::shared_ptr<const NodeFilter>& filter)
      : _node(node), _filter(filter) {}

  // The next accepted sibling, or the end (null). At the end it stays there.
  NodeFilterIterator& MoveToSibling();
  // The first accepted child, or the end. At the end it stays there.
  NodeFilterIterator& MoveToChild();
  // A copy moved to the first accepted child.
  NodeFilterIterator GetChild() const;

  Tamber::Xml::Node* GetNode() const { return _node; }
  bool AtEnd() const { return _node == nullptr; }

 private:
  Tamber::Xml::Node* _node;
  boost::shared_ptr<const NodeFilter> _filter;
};

// The current node as an element, or null (also at the end).
Tamber::Xml::ElementNode* IteratorToElement(const NodeFilterIterator& it);

// Parses a whole stream or text with the hardened parser into `doc`. Parse errors pass through
// as Tamber::Xml::XMLParseException; `doc` then keeps what it held.
void ParseXML(Tamber::Reader* reader, Tamber::Ref<Tamber::Xml::Document>& doc);
void ParseXML(const std::string& text, Tamber::Ref<Tamber::Xml::Document>& doc);

// The first child of `node` when it is a text node, else null (null for null input).
Tamber::Xml::TextNode* GetTextNode(const Tamber::Xml::Node* node);
// The text of `node` unchanged; empty for null.
std::string GetText(const Tamber::Xml::TextNode* node);

// Resolves a qualified name found on or in `element`: an unprefixed name takes
// `defaultNamespace`; a prefix is looked up in scope at `element`. An unbound or empty prefix
// raises ParseException naming the element and its position; `result` is then unchanged.
void ResolveQName(const Tamber::Xml::ElementNode* element, const std::string& name,
                  const std::string& defaultNamespace, Tamber::Xml::QName& result);

// "YYYY-MM-DDThh:mm:ss.mmm" followed by the date's short zone designator ("Z").
std::string DateTimeFormatter(Tamber::System::DateTime date);
// `date` moved by `minutes` (negative moves back).
Tamber::System::DateTime AddMinutesToDate(Tamber::System::DateTime date, int minutes);

}  // namespace SsoClient

#endif
