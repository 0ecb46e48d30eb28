#pragma once

#include "platform/PtreeSerialization.h"
#include "platform/host/documents/PtreeReader.h"
#include "platform/host/documents/PtreeWriter.h"

namespace vesprun {

class HostPtreeSerialization final : public PtreeSerialization {
 public:
  std::optional<PropertyValue> parse(std::string_view bytes, std::string& error) override {
    return readPtree(bytes, error);
  }

  std::optional<std::string> serialize(const PropertyDict& dict, std::string& error) override {
    std::string document;
    return writePtree(dict, document, error) ? std::optional(std::move(document)) : std::nullopt;
  }
};

}  // namespace vesprun
