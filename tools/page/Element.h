#pragma once

#include <string>
#include <string_view>
#include <type_traits>
#include <utility>
#include <vector>

namespace vesprun {

/// A text that is a part of this program: nothing else converts to it.
class ConstantText {
 public:
  // NOLINTNEXTLINE(google-explicit-constructor): literals are to convert
  consteval ConstantText(const char* text) : _text(text) {}
  constexpr const char* text() const { return _text; }

 private:
  const char* _text;
};

/// An attribute. Without a value it stands alone, such as "open".
struct Attribute {
  ConstantText name;
  std::string value{};
};
using Attributes = std::vector<Attribute>;

/// A part of a page: an element, a text, or several of them. Texts and the values of attributes are
/// escaped when they are written, so that nothing foreign ever becomes markup.
class Element {
 public:
  /// Nothing.
  Element() = default;

  // NOLINTBEGIN(google-explicit-constructor): texts and lists are to convert
  Element(std::string text) : _text(std::move(text)) {}
  Element(std::string_view text) : _text(text) {}
  Element(const char* text) : _text(text) {}
  Element(std::vector<Element> parts) : _children(std::move(parts)) {}
  // NOLINTEND(google-explicit-constructor)

  template <typename... Children>
  Element(ConstantText tag, Attributes attributes, Children&&... children)
      : _tag(tag.text()), _attributes(std::move(attributes)) {
    _children.reserve(sizeof...(children));
    (add(std::forward<Children>(children)), ...);
  }

  /// A style sheet or a script.
  static Element embedded(ConstantText tag, ConstantText content);

  /// Text of the page itself, such as a tab, as it is.
  static Element constant(ConstantText text);

  Element& add(Element child) {
    _children.push_back(std::move(child));
    return *this;
  }

  bool isEmpty() const {
    return _tag == nullptr && _embedded == nullptr && _text.empty() && _children.empty();
  }

  void writeTo(std::string& html) const;

 private:
  const char* _tag = nullptr;  ///< null: a text, or children without a common element
  const char* _embedded = nullptr;
  std::string _text;
  Attributes _attributes;
  std::vector<Element> _children;
};

/// A key or another name from elsewhere: in an element of its own, so that its direction changes
/// nothing around it, and cut in the middle when it is long (`isLongName`).
Element nameElement(std::string_view name);
bool isLongName(std::string_view name);

/// The beginning and the end of a text of more than `longest` bytes, with "…" between.
std::string cutInTheMiddle(std::string_view text, std::size_t longest);

/// Something that can be folded away.
Element folded(Element summary, Element content, bool isOpen = false);

}  // namespace vesprun
