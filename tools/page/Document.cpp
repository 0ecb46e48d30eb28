#include "page/Document.h"

#include <sha256.h>

#include <array>
#include <cstring>

#include "platform/host/documents/Base64.h"

namespace vesprun {
namespace {

/// What a content policy calls a text that it lets in: 'sha256-…'.
std::string sourceOf(ConstantText text) {
  std::array<std::uint8_t, SHA256_DIGEST_LENGTH> digest{};
  SHA2_CTX context;
  SHA256Init(&context);
  SHA256Update(&context, reinterpret_cast<const std::uint8_t*>(text.text()),
               std::strlen(text.text()));
  SHA256Final(digest.data(), &context);
  std::string source = "'sha256-";
  appendBase64(digest, source);
  return source + '\'';
}

Element meta(ConstantText name, std::string content) {
  return {"meta", {{"name", name.text()}, {"content", std::move(content)}}};
}

}  // namespace

Document::Document(const std::string& title) {
  // Own quotes, which would be escaped in an attribute: the policy is all of constants.
  _html =
      "<!DOCTYPE html>\n<html lang=en>\n<meta charset=utf-8>\n"
      "<meta http-equiv=Content-Security-Policy content=\"default-src 'none'; style-src ";
  _html += sourceOf(kPageStyle) + "; script-src " + sourceOf(kPageScript) +
           "; base-uri 'none'; form-action 'none'\">\n";
  add(meta("viewport", "width=device-width, initial-scale=1"));
  add(meta("color-scheme", "light dark"));
  add({"title", {}, title});
  add(Element::embedded("style", kPageStyle));
}

void Document::beginSection(ConstantText anchor, ConstantText title) {
  _html += std::string("\n<section id=") + anchor.text() + '>';
  add({"h2", {}, title.text()});
}

void Document::endSection() { _html += "</section>"; }

std::string Document::finished() {
  _html += "\n</main>\n";
  add(Element::embedded("script", kPageScript));
  _html += "\n</html>\n";
  return std::move(_html);
}

Element pageHeader(const std::string& title, std::vector<Element> lines) {
  Element header("header", {}, Element("h1", {}, nameElement(title)));
  for (Element& line : lines) {
    header.add({"p", {}, std::move(line)});
  }
  return header;
}

Element headCell(std::string text) { return {"th", {{"scope", "col"}}, std::move(text)}; }

Element headRow(std::initializer_list<const char*> titles) {
  Element row("tr", {});
  for (const char* const title : titles) {
    row.add(headCell(title));
  }
  return {"thead", {}, std::move(row)};
}

Element rowHead(Element content) { return {"th", {{"scope", "row"}}, std::move(content)}; }

Element cell(std::string text) { return {"td", {}, std::move(text)}; }

}  // namespace vesprun
