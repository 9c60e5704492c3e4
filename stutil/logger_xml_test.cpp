#include "stutil/logger_xml.h"

#include <gtest/gtest.h>

namespace stutil {
namespace {

const LoggerLevels kRaised{"MODULE", "ALL"};

TEST(LoggerXml, OnlyTheTwoElementsChange) {
  const std::string text =
      "\xEF\xBB\xBF<?xml version=\"1.0\"?>\n<!-- a -->\n<configuration path=\"x\">\n  <depth/>\n  <level "
      "a=\"b\">ERROR</level> <!-- c -->\n</configuration>\n<!-- d -->\n";
  EXPECT_EQ(
      WithLoggerLevels(text, kRaised),
      "\xEF\xBB\xBF<?xml version=\"1.0\"?>\n<!-- a -->\n<configuration path=\"x\">\n    <depth>MODULE</depth>\n    "
      "<level a=\"b\">ALL</level>\n    <!-- c -->\n</configuration>\n\n<!-- d -->");
}

// Each of them would lose a part, or become unreadable, if it were written again.
TEST(LoggerXml, WhatIsNoWholeDocumentIsRefused) {
  const std::string document = "<configuration><level>ALL</level></configuration>";
  ASSERT_TRUE(WithLoggerLevels(document, kRaised));
  for (const std::string& text : {
           std::string(),
           std::string("<?xml"),
           std::string("<configuration>"),
           std::string("<other/>"),
           document + "text",
           "text" + document,
           document + "</configuration><configuration/>",
           document + '\0' + "<more/>",
       }) {
    EXPECT_FALSE(WithLoggerLevels(text, kRaised)) << text;
    EXPECT_FALSE(ReadLoggerXml(text)) << text;
  }
}

}  // namespace
}  // namespace stutil
