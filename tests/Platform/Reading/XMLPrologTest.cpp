#include "Platform/Reading/NotTaken.h"
#include "Platform/Reading/ReaderTestSupport.h"
#include "Platform/Reading/XMLProlog.h"

#include <gtest/gtest.h>

#include <string>

namespace xquery {
namespace {

using readingtest::isRefused;
using readingtest::isTaken;

TEST(XMLProlog, DeclarationsThatAreTaken) {
  for (const char* text :
       {"<?xml version=\"1.0\"?>", "<?xml version='1.0'?>", "<?xml version='1.0' ?>",
        "<?xml\tversion\n=\r'1.0'\n?>", "<?xml version='1.0' encoding='UTF-8'?>",
        "<?xml version='1.0' encoding=\"utf-8\" ?>", "<?xml version='1.0' encoding='US-ASCII'?>",
        "<?xml version='1.0' standalone='yes'?>", "<?xml version='1.0' standalone = \"no\" ?>",
        "<?xml version='1.0'\n encoding = 'UTF-8'\n standalone='yes'?>"}) {
    EXPECT_TRUE(isTaken(std::string(text) + "<a>x</a>")) << text;
  }
}

TEST(XMLProlog, DeclarationsThatAreNot) {
  for (const char* text : {"<?xml?>",
                           "<?xml ?>",
                           "<?xml version='1.1'?>",
                           "<?xml version='2.0'?>",
                           "<?xml version='1.0\"?>",
                           "<?xml version=1.0?>",
                           "<?xml version='1.0'encoding='UTF-8'?>",
                           "<?xml encoding='UTF-8'?>",
                           "<?xml encoding='UTF-8' version='1.0'?>",
                           "<?xml version='1.0' encoding='UTF-16'?>",
                           "<?xml version='1.0' encoding='ISO-8859-1'?>",
                           "<?xml version='1.0' encoding='no-such'?>",
                           "<?xml version='1.0' encoding=''?>",
                           "<?xml version='1.0' standalone='maybe'?>",
                           "<?xml version='1.0' standalone='YES'?>",
                           "<?xml version='1.0' standalone='yes' encoding='UTF-8'?>",
                           "<?xml version='1.0' other='x'?>",
                           "<?xml version='1.0'>",
                           "<?xml version='1.0'? >",
                           " <?xml version='1.0'?>",
                           "<?xml version='1.0'?><?xml version='1.0'?>",
                           "<?XML version='1.0'?>",
                           "<?xmL x?>",
                           "<?xml-x y?>",
                           "<!--x--><?xml version='1.0'?>"}) {
    EXPECT_FALSE(isTaken(std::string(text) + "<a>x</a>")) << text;
  }
}

TEST(XMLProlog, WhatIsDeclaredToBeASCIIIsNothingElse) {
  const std::string declaration = "<?xml version='1.0' encoding='us-ascii'?>";
  EXPECT_TRUE(isTaken(declaration + "<a b='&#233;'>&#233;</a>"));
  for (const char* text :
       {"<a>\xC3\xA9</a>", "<a b='\xC3\xA9'/>", "<\xC3\xA9/>", "<a \xC3\xA9='x'/>",
        "<a><!--\xC3\xA9--></a>", "<a><![CDATA[\xC3\xA9]]></a>", "<a><?b \xC3\xA9?></a>",
        "<a><?\xC3\xA9?></a>"}) {
    EXPECT_FALSE(isTaken(declaration + text)) << text;
    EXPECT_TRUE(isRefused(declaration + text)) << text;
    EXPECT_TRUE(isTaken(text)) << text;
  }
  EXPECT_FALSE(isTaken("\xEF\xBB\xBF" + declaration + "<a/>"));
}

TEST(XMLProlog, AByteOrderMarkIsPassedOver) {
  EXPECT_TRUE(isTaken("\xEF\xBB\xBF<a/>"));
  EXPECT_TRUE(isTaken("\xEF\xBB\xBF<?xml version='1.0'?><a/>"));
  EXPECT_TRUE(isTaken("\xEF\xBB\xBF\n<a/>"));
  EXPECT_FALSE(isTaken("\xEF\xBB\xBF\xEF\xBB\xBF<a/>"));
  EXPECT_FALSE(isTaken("<a/>\xEF\xBB\xBF"));
  EXPECT_FALSE(isTaken("\xEF\xBB<a/>"));
  EXPECT_FALSE(isTaken("\xFE\xFF<a/>"));
}

TEST(XMLProlog, DocumentTypesThatAreTaken) {
  for (const char* text :
       {"<!DOCTYPE a>", "<!DOCTYPE\na\t>", "<!DOCTYPE other:name>", "<!DOCTYPE a SYSTEM 'a.dtd'>",
        "<!DOCTYPE a SYSTEM \"\" >", "<!DOCTYPE a PUBLIC '-//W3C//DTD X 1.0//EN' 'http://x/y'>",
        "<!DOCTYPE a PUBLIC\n\"\"\n\"it's\"\n>"}) {
    EXPECT_TRUE(isTaken(std::string(text) + "<a/>")) << text;
    EXPECT_TRUE(isTaken("<?xml version='1.0'?>\n<!--x-->" + std::string(text) + "<?x?>\n<b/>"));
  }
}

TEST(XMLProlog, DocumentTypesThatAreNot) {
  for (const char* text : {"<!DOCTYPE>",
                           "<!DOCTYPE >",
                           "<!DOCTYPEa>",
                           "<!doctype a>",
                           "<!DOCTYPE 1>",
                           "<!DOCTYPE a []>",
                           "<!DOCTYPE a [<!ENTITY e 'x'>]>",
                           "<!DOCTYPE a SYSTEM>",
                           "<!DOCTYPE a SYSTEM'a'>",
                           "<!DOCTYPE a SYSTEM 'a' 'b'>",
                           "<!DOCTYPE a PUBLIC 'a'>",
                           "<!DOCTYPE a PUBLIC '{' 'b'>",
                           "<!DOCTYPE a PUBLIC 'a''b'>",
                           "<!DOCTYPE a PRIVATE 'a'>",
                           "<!DOCTYPE a SYSTEM '\xC3\xA9'>",
                           "<!DOCTYPE a SYSTEM '>'>",
                           "<!DOCTYPE a SYSTEM 'a' b>",
                           "<!DOCTYPE a><!DOCTYPE a>",
                           "<!ELEMENT a ANY>",
                           "<![CDATA[x]]>"}) {
    EXPECT_FALSE(isTaken(std::string(text) + "<a/>")) << text;
  }
  EXPECT_FALSE(isTaken("<a/><!DOCTYPE a>"));
  EXPECT_FALSE(isTaken("<a><!DOCTYPE a></a>"));
}

}  // namespace
}  // namespace xquery
