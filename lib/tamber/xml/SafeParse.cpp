#include "tamber/xml/SafeParse.h"

#include <algorithm>
#include <exception>
#include <memory>

#include <libxml/SAX2.h>
#include <libxml/entities.h>
#include <libxml/parser.h>
#include <libxml/parserInternals.h>

#include "tamber/Panic.h"
#include "tamber/xml/LibXml.h"
#include "tamber/xml/NodeImpl.h"

namespace Tamber {
namespace Xml {

namespace {

// No entity substitution, no DTD loading or attribute defaults, no network, no XInclude; blanks
// and CDATA sections stay as they are. Errors arrive through the context's own handler only.
constexpr int kParseOptions = XML_PARSE_NONET | XML_PARSE_NOERROR | XML_PARSE_NOWARNING | XML_PARSE_COMPACT;

// Bytes handed to libxml2 per read. The limits are looked at between reads, so this bounds how far
// a start tag can run past them before the parse stops.
constexpr int kReadChunk = 4000;

// libxml2 grows its attribute table of a start tag to 10 * n + 10 entries when it stores the
// (n + 1)th attribute, and checks the attributes for duplicates pairwise only once the whole tag
// is read. A table above this size shows a tag with more than kMaxAttributes attributes before
// that quadratic check runs.
constexpr int kMaxAttributeTable = 10 * kMaxAttributes;

struct ParseState {
  xmlParserCtxtPtr context = nullptr;
  Reader* reader = nullptr;
  size_t bytesRead = 0;
  int depth = 0;
  // The first reason to refuse the document, "line L, column C: what", and the first error
  // libxml2 reported.
  std::string refusal;
  std::string libxmlError;
  std::exception_ptr readFailure;
};

ParseState& StateOf(void* context) {
  return *static_cast<ParseState*>(static_cast<xmlParserCtxtPtr>(context)->_private);
}

std::string CurrentPosition(xmlParserCtxtPtr context) {
  const int line = context->input != nullptr ? context->input->line : 0;
  const int column = context->input != nullptr ? context->input->col : 0;
  return "line " + std::to_string(line) + ", column " + std::to_string(column);
}

void Refuse(ParseState& state, const std::string& what) {
  if (state.refusal.empty()) state.refusal = CurrentPosition(state.context) + ": " + what;
}

// From a SAX callback, where libxml2 allows stopping the parse.
void RefuseAndStop(void* context, const std::string& what) {
  Refuse(StateOf(context), what);
  xmlStopParser(static_cast<xmlParserCtxtPtr>(context));
}

// From the read callback, where xmlStopParser would free the input buffer being filled: the
// parser leaves at its next check of its state, with SAX events and errors already off.
void RefuseFromRead(ParseState& state, const std::string& what) {
  Refuse(state, what);
  state.context->instate = XML_PARSER_EOF;
  state.context->disableSAX = 1;
}

// --- SAX hooks ---------------------------------------------------------------------------------

void OnInternalSubset(void* context, const xmlChar*, const xmlChar*, const xmlChar*) {
  RefuseAndStop(context, "DOCTYPE is not allowed");
}

xmlParserInputPtr OnResolveEntity(void* context, const xmlChar*, const xmlChar*) {
  RefuseAndStop(context, "external entities are not allowed");
  return nullptr;
}

// Only the five predefined entities exist; there is never a DTD to declare others.
xmlEntityPtr OnGetEntity(void*, const xmlChar* name) { return xmlGetPredefinedEntity(name); }

bool IsDecodedByLibXml(const char* encoding) {
  static const char* const kAllowed[] = {"UTF-8", "UTF-16", "UTF-16LE", "UTF-16BE", "ISO-8859-1", "ASCII", "US-ASCII"};
  return std::any_of(std::begin(kAllowed), std::end(kAllowed), [encoding](const char* allowed) {
    return xmlStrcasecmp(reinterpret_cast<const xmlChar*>(encoding), reinterpret_cast<const xmlChar*>(allowed)) == 0;
  });
}

// Called once the XML declaration is read, so after any switch of encoding: other encodings would
// go through iconv, a much larger decoder than this input deserves.
void OnStartDocument(void* context) {
  auto* parser = static_cast<xmlParserCtxtPtr>(context);
  xmlParserInputBufferPtr buffer = parser->input != nullptr ? parser->input->buf : nullptr;
  if (buffer != nullptr && buffer->encoder != nullptr && !IsDecodedByLibXml(buffer->encoder->name)) {
    RefuseAndStop(context, std::string("encoding '") + buffer->encoder->name +
                               "' is not allowed (UTF-8, UTF-16, ISO-8859-1 or US-ASCII expected)");
    return;
  }
  xmlSAX2StartDocument(context);
}

void OnStartElement(void* context, const xmlChar* localName, const xmlChar* prefix, const xmlChar* uri,
                    int namespaceCount, const xmlChar** namespaces, int attributeCount, int defaultedCount,
                    const xmlChar** attributes) {
  auto* parser = static_cast<xmlParserCtxtPtr>(context);
  ParseState& state = StateOf(context);
  if (++state.depth > kMaxDepth) {
    RefuseAndStop(context, "elements are nested deeper than " + std::to_string(kMaxDepth) + " levels");
    return;
  }
  if (attributeCount + namespaceCount > kMaxAttributes) {
    RefuseAndStop(context, "an element has more than " + std::to_string(kMaxAttributes) + " attributes");
    return;
  }
  if (parser->nsNr / 2 > kMaxNamespacesInScope) {
    RefuseAndStop(context, "more than " + std::to_string(kMaxNamespacesInScope) +
                               " namespace declarations are in scope");
    return;
  }
  xmlNodePtr parent = parser->node;
  xmlSAX2StartElementNs(context, localName, prefix, uri, namespaceCount, namespaces, attributeCount,
                        defaultedCount, attributes);
  // Where the start tag ends, as a SAX locator reports it; libxml2 keeps no column.
  if (parser->node != nullptr && parser->node != parent && parser->input != nullptr) {
    SetParsedPosition(parser->node, static_cast<unsigned>(parser->input->line),
                      static_cast<unsigned>(parser->input->col));
  }
}

void OnEndElement(void* context, const xmlChar* localName, const xmlChar* prefix, const xmlChar* uri) {
  --StateOf(context).depth;
  xmlSAX2EndElementNs(context, localName, prefix, uri);
}

void OnError(void* context, xmlErrorPtr error) {
  ParseState& state = StateOf(context);
  if (error == nullptr || error->level < XML_ERR_ERROR || !state.libxmlError.empty()) return;
  state.libxmlError = DescribeXmlError(*error);
}

// --- Input -------------------------------------------------------------------------------------

int OnRead(void* context, char* buffer, int length) {
  ParseState& state = *static_cast<ParseState*>(context);
  xmlParserCtxtPtr parser = state.context;
  if (parser->maxatts > kMaxAttributeTable) {
    RefuseFromRead(state, "an element has more than " + std::to_string(kMaxAttributes) + " attributes");
    return 0;
  }
  if (parser->nsNr / 2 > kMaxNamespacesInScope) {
    RefuseFromRead(state, "more than " + std::to_string(kMaxNamespacesInScope) + " namespace declarations are in scope");
    return 0;
  }
  // One byte past the bound tells a document of exactly the bound from a larger one.
  const size_t wanted = std::min({static_cast<size_t>(length), static_cast<size_t>(kReadChunk),
                                  kMaxDocumentBytes + 1 - state.bytesRead});
  size_t count;
  try {
    count = state.reader->Read(buffer, wanted);
  } catch (...) {
    state.readFailure = std::current_exception();
    RefuseFromRead(state, "the input could not be read");
    return -1;
  }
  TAMBER_VERIFY(count <= wanted);
  state.bytesRead += count;
  if (state.bytesRead > kMaxDocumentBytes) {
    RefuseFromRead(state, "the document is larger than " + std::to_string(kMaxDocumentBytes) + " bytes");
    return 0;
  }
  return static_cast<int>(count);
}

void InstallHooks(xmlSAXHandlerPtr sax) {
  sax->internalSubset = &OnInternalSubset;
  sax->externalSubset = &OnInternalSubset;
  sax->resolveEntity = &OnResolveEntity;
  sax->getEntity = &OnGetEntity;
  sax->getParameterEntity = nullptr;
  sax->entityDecl = nullptr;
  sax->attributeDecl = nullptr;
  sax->elementDecl = nullptr;
  sax->notationDecl = nullptr;
  sax->unparsedEntityDecl = nullptr;
  sax->startDocument = &OnStartDocument;
  sax->startElementNs = &OnStartElement;
  sax->endElementNs = &OnEndElement;
  sax->serror = &OnError;
}

struct ContextDeleter {
  void operator()(xmlParserCtxtPtr context) const { xmlFreeParserCtxt(context); }
};
struct DocDeleter {
  void operator()(xmlDocPtr doc) const { xmlFreeDoc(doc); }
};

}  // namespace

void ParseUntrustedXml(Reader* reader, Ref<Document>& document) {
  if (reader == nullptr) throw InvalidArgumentException("the reader is null");
  EnsureLibXmlInitialized();
  // Errors raised outside the context (by the decoders) would otherwise reach stderr.
  ScopedXmlErrorCapture outOfContextErrors;
  std::unique_ptr<xmlParserCtxt, ContextDeleter> context(xmlNewParserCtxt());
  if (!context) throw std::bad_alloc();
  InstallHooks(context->sax);
  ParseState state;
  state.context = context.get();
  state.reader = reader;
  context->_private = &state;

  std::unique_ptr<xmlDoc, DocDeleter> doc(
      xmlCtxtReadIO(context.get(), &OnRead, nullptr, &state, nullptr, nullptr, kParseOptions));
  if (state.readFailure) std::rethrow_exception(state.readFailure);
  // Belt and braces: a DTD that reached the tree in any way is refused too.
  if (doc && (doc->intSubset != nullptr || doc->extSubset != nullptr)) Refuse(state, "DOCTYPE is not allowed");

  std::string failure = state.refusal;
  if (failure.empty()) failure = state.libxmlError;
  if (failure.empty()) failure = outOfContextErrors.GetFirstError();
  if (failure.empty() && !doc) failure = CurrentPosition(context.get()) + ": the document is not well-formed";
  if (!failure.empty()) throw XMLParseException("XML parse error at " + failure);
  AdoptXmlDocument(doc.release(), document);
}

}  // namespace Xml
}  // namespace Tamber
