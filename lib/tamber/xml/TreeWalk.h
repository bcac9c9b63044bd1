#ifndef TAMBER_XML_TREEWALK_H
#define TAMBER_XML_TREEWALK_H

#include <libxml/tree.h>

namespace Tamber {
namespace Xml {

// Visits `root` and its descendants in document order (children only, not attributes), without
// recursion: built trees have no depth limit. `visit` may change a node's name, namespace or
// _private, but not the links of the tree.
template <class Visit>
void ForEachInSubtree(xmlNodePtr root, Visit visit) {
  xmlNodePtr current = root;
  while (current != nullptr) {
    visit(current);
    // An entity reference's children belong to the entity declaration, not to the tree.
    if (current->children != nullptr && current->type != XML_ENTITY_REF_NODE) {
      current = current->children;
      continue;
    }
    while (current != root && current->next == nullptr) current = current->parent;
    if (current == root) return;
    current = current->next;
  }
}

}  // namespace Xml
}  // namespace Tamber

#endif
