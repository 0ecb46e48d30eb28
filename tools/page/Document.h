#pragma once

#include <string>
#include <string_view>
#include <vector>

#include "page/Element.h"

namespace vesprun {

/// A whole HTML document on its way out: it needs nothing but itself, and nothing that it did not
/// come with is loaded or run in it. Each part is written when it is added, and need not be kept.
class Document {
 public:
  explicit Document(const std::string& title);

  void add(const Element& part) { part.writeTo(_html); }

  /// The parts between belong to one section with a heading.
  void beginSection(ConstantText anchor, ConstantText title);
  void endSection();

  /// The whole text. Nothing can be added after it.
  std::string finished();

 private:
  std::string _html;
};

/// The big line at the top, and small ones below it.
Element pageHeader(const std::string& title, std::vector<Element> lines);

/// A table's head cell.
Element headCell(std::string text);
/// A table's head row.
Element headRow(std::initializer_list<const char*> titles);
/// The first cell of a row.
Element rowHead(Element content);
Element cell(std::string text);

/// From page.css and page.js.
extern const ConstantText kPageStyle;
extern const ConstantText kPageScript;

}  // namespace vesprun
