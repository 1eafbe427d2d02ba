#include "CheckTesting.h"

namespace xquery {
namespace {

using namespace checktest;

TEST(CheckedConstructors, Content) {
  expectWarnings({
      {"<a>{ 'x', attribute b { 1 } }</a>", "1 late-attribute"},
      {"<a>x{\nattribute b { 1 } }</a>", "2 late-attribute"},
      {"<a><b/>{ attribute b { 1 } }</a>", "1 late-attribute"},
      {"element a { <b/>, //x/@id }", "1 late-attribute"},
      {"<a>{ attribute b { 1 }, 'x' }</a>", ""},
      {"<a> { attribute b { 1 } }</a>", ""},
      {"declare xmlspace preserve; <a> { attribute b { 1 } }</a>", "1 late-attribute"},
      {"<a c='1'>{ attribute b { 1 } }<b/></a>", ""},
      {"<a>{ //x, attribute b { 1 } }</a>", ""},
      {"<a xmlns:p='urn:p'>{ (), attribute b { 1 } }</a>", ""},
      {"document { <a/>, <b/> }", "1 document-elements"},
      {"document { <a/>, comment { 'x' } }, document { //a }", ""},
  });
}

}  // namespace
}  // namespace xquery
