// A folder.cfg as the reader sees it: a read-only node tree built straight
// from expat.
//
// It is the tree wxXmlDocument::Load(stream, "UTF-8",
// wxXMLDOC_KEEP_WHITESPACE_NODES) builds for the same bytes, less the text
// nodes that are blank as a whole, but without an object and two wide
// strings per node: the nodes sit in one vector and refer to each other by
// index, their names and texts are UTF-8 slices of one buffer. Building and
// freeing it takes no recursion, however deep the document nests.
#ifndef HF_LEGACY_CONFIG_TREE_H_
#define HF_LEGACY_CONFIG_TREE_H_

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

class ConfigTree {
 public:
  using Id = std::uint32_t;
  static constexpr Id kNone = UINT32_MAX;
  static constexpr Id kDocument = 0;  // once Parse has succeeded

  // As wxXmlNodeType; kDocument is the node above the root element.
  enum class Type : std::uint8_t { kDocument, kElement, kText, kCdata, kComment, kPi };

  // Builds the tree of `bytes`, encoding "UTF-8" unless the document
  // declares another. A text node that holds only ' ', '\t', '\n' and '\r'
  // is left out; every other one is kept whole, as XML gives it: references
  // replaced (those to entities declared in the document dropped), line
  // ends read as a line feed, text split by nothing but such references
  // joined. False, leaving no tree, when expat refuses the bytes.
  bool Parse(const std::string& bytes);

  // The first element below the document node, or kNone.
  Id Root() const;

  Type GetType(Id node) const { return nodes_[node].type; }
  Id Parent(Id node) const { return nodes_[node].parent; }
  Id FirstChild(Id node) const { return nodes_[node].first_child; }
  Id Next(Id node) const { return nodes_[node].next; }
  // An element's name or a processing instruction's target; empty for
  // other nodes.
  std::string_view Name(Id node) const { return Slice(nodes_[node].name); }
  // The text of a text, CDATA, comment or processing instruction node;
  // empty for an element.
  std::string_view Content(Id node) const { return Slice(nodes_[node].content); }

 private:
  friend struct ConfigTreeBuilder;

  struct Span {
    std::uint32_t at = 0;
    std::uint32_t size = 0;
  };
  struct Node {
    Type type;
    Id parent = kNone;
    Id first_child = kNone;
    Id next = kNone;
    Span name;
    Span content;
  };

  std::string_view Slice(Span span) const {
    return std::string_view(text_).substr(span.at, span.size);
  }

  std::vector<Node> nodes_;  // nodes_[0] is the document node
  std::string text_;         // every name and content, UTF-8
};

#endif  // HF_LEGACY_CONFIG_TREE_H_
