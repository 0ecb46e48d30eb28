#pragma once

#include <gtest/gtest.h>

#include <string>

#include "platform/host/documents/JsonForm.h"
#include "platform/host/documents/PtreeReader.h"
#include "platform/host/documents/PtreeWriter.h"

namespace vesprun {

// Each fails the test when there is no such value or document.

inline PropertyValue valueOfJson(std::string_view text) {
  std::string error;
  const std::optional<PropertyValue> value = valueFromJsonText(text, error);
  EXPECT_TRUE(value) << text << ": " << error;
  return value.value_or("not read");
}

inline PropertyValue valueOfPtree(const std::string& document) {
  std::string error;
  const std::optional<PropertyValue> value = readPtree(document, error);
  EXPECT_TRUE(value) << document.substr(0, 300) << ": " << error;
  return value.value_or("not read");
}

inline std::string ptreeOf(const PropertyValue& value) {
  std::string document;
  std::string error;
  EXPECT_TRUE(writePtree(value, document, error)) << error;
  return document;
}

}  // namespace vesprun
