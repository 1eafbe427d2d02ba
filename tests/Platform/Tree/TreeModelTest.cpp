// Trees under random operations against a plain model of them, which knows parents, lists of
// children and texts and nothing else.
#include "Platform/Base/WorkMeter.h"
#include "Platform/Tree/Arena.h"
#include "Platform/Tree/Names.h"
#include "Platform/Tree/TreeHead.h"
#include "Platform/Tree/XMLTestSupport.h"
#include "xquery/XMLNode.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <memory>
#include <random>
#include <string>
#include <vector>

namespace xquery {
namespace {

struct Model {
  Kind kind;
  std::string name;
  std::u16string text;
  Model* parent = nullptr;
  std::vector<Model*> namespaces, attributes, children;
  Ref<NSXMLNode> node;

  std::vector<Model*>& listOf(Kind member) {
    return member == Kind::Attribute   ? attributes
           : member == Kind::Namespace ? namespaces
                                       : children;
  }
  bool isBranch() const { return kind == Kind::Element || kind == Kind::Document; }
  bool isProperty() const { return kind == Kind::Attribute || kind == Kind::Namespace; }
  Model* root() { return parent ? parent->root() : this; }
};

class Forest {
 public:
  explicit Forest(uint32_t seed) : _random(seed) {}

  void step() {
    Model* const a = any();
    Model* const b = any();
    switch (_random() % 12) {
      case 0:
      case 1:
      case 2:
        make();
        break;
      case 3:
      case 4:
        add(a, b, UINT32_MAX);
        break;
      case 5:
        add(a, b, _random() % 4);
        break;
      case 6:
        if (a) detach(*a);
        break;
      case 7:
        if (a && _models.size() < 400) copy(*a);
        break;
      case 8:
      case 9:
        if (a) setText(*a);
        break;
      case 10:
        if (a && b) compareOrder(*a, *b);
        break;
      default:
        if (_random() % 8 == 0) read();
    }
    if (!a) return;
    ASSERT_NO_FATAL_FAILURE(expectSame(*a->root()));
  }

  void expectAllSame() {
    for (const auto& model : _models) {
      if (model->parent) continue;
      ASSERT_NO_FATAL_FAILURE(expectSame(*model));
    }
    for (const auto& [string, text] : _strings) {
      ASSERT_EQ(string->view().utf16(), text) << "a string has changed with its tree";
    }
  }

 private:
  Model* any() { return _models.empty() ? nullptr : _models[_random() % _models.size()].get(); }

  std::u16string anyText() {
    static constexpr size_t lengths[] = {0, 1, 3, 8, 9, 16, 40, 120, 128, 129, 300, 2000};
    std::u16string text(lengths[_random() % std::size(lengths)], u'a');
    for (char16_t& unit : text) unit = static_cast<char16_t>(u'a' + _random() % 26);
    if (!text.empty() && _random() % 3 == 0) text.back() = u'\x3B1';
    return text;
  }
  static NSStringView viewOf(const std::u16string& text) {
    return {text.data(), static_cast<uint32_t>(text.size())};
  }
  std::string anyName() { return "n" + std::to_string(_random() % 6); }

  Model* added(Kind kind, std::string name, std::u16string text, Ref<NSXMLNode> node) {
    _models.push_back(std::make_unique<Model>());
    Model* const model = _models.back().get();
    model->kind = kind;
    model->name = std::move(name);
    model->text = std::move(text);
    model->node = std::move(node);
    return model;
  }

  void make() {
    const std::string name = anyName();
    const std::u16string text = anyText();
    switch (_random() % 8) {
      case 0:
        added(Kind::Text, "", text, NSXMLNode::textWithStringValue(viewOf(text)));
        break;
      case 1:
        added(Kind::Comment, "", text, NSXMLNode::commentWithStringValue(viewOf(text)));
        break;
      case 2:
        added(Kind::ProcessingInstruction, name, text,
              NSXMLNode::processingInstructionWithName(A(name), viewOf(text)));
        break;
      case 3:
        added(Kind::Attribute, name, text, NSXMLNode::attributeWithName(A(name), viewOf(text)));
        break;
      case 4:
        added(Kind::Namespace, name, text, NSXMLNode::namespaceWithName(A(name), viewOf(text)));
        break;
      case 5:
        if (_random() % 4 == 0) {
          added(Kind::Document, "", u"", NSXMLDocument::document());
          break;
        }
        [[fallthrough]];
      default:
        added(Kind::Element, name, u"", NSXMLElement::elementWithName(A(name)));
    }
  }

  void add(Model* parent, Model* node, uint32_t index) {
    if (!parent || !node) return;
    auto* const element = dyn_cast<NSXMLElement>(parent->node.get());
    auto* const document = dyn_cast<NSXMLDocument>(parent->node.get());
    if (!element && !document) return;
    bool mayBeAdded = !node->parent;
    std::vector<Model*>& list = parent->listOf(node->kind);
    if (node->isProperty()) {
      if (!element) return;
      for (const Model* other : list) mayBeAdded = mayBeAdded && other->name != node->name;
      ASSERT_EQ(node->kind == Kind::Attribute ? element->addAttribute(node->node)
                                              : element->addNamespace(node->node),
                mayBeAdded);
      index = UINT32_MAX;
    } else {
      mayBeAdded = mayBeAdded && node->kind != Kind::Document && parent->root() != node;
      const bool isAdded = element ? element->insertChild(node->node, index)
                                   : document->insertChild(node->node, index);
      ASSERT_EQ(isAdded, mayBeAdded);
    }
    if (!mayBeAdded) return;
    list.insert(list.begin() + std::min<ptrdiff_t>(index, std::ssize(list)), node);
    node->parent = parent;
  }

  void detach(Model& model) {
    model.node->detach();
    if (!model.parent) return;
    std::erase(model.parent->listOf(model.kind), &model);
    model.parent = nullptr;
  }

  // The model of what is there.
  Model* modelOf(NSXMLNode* node) {
    std::string name = node->hasName() ? node->nameView().utf8() : "";
    Model* const model = added(node->kind(), std::move(name), node->textView().utf16(), node);
    const auto take = [&](NSXMLNode* part) {
      Model* const made = modelOf(part);
      made->parent = model;
      model->listOf(made->kind).push_back(made);
    };
    if (const auto* element = dyn_cast<NSXMLElement>(node)) {
      const NSXMLNode* property = NSXMLTree::firstPropertyOf(element);
      for (; property; property = NSXMLTree::nextProperty(property)) {
        take(const_cast<NSXMLNode*>(property));
      }
    }
    for (NSXMLNode* child = node->firstChild(); child; child = child->nextSibling()) take(child);
    return model;
  }

  void copy(const Model& model) {
    const Ref<NSXMLNode> node = model.node->copy();
    ASSERT_NO_FATAL_FAILURE(expectSame(model, node.get()));
    modelOf(node.get());
  }

  void read() {
    const std::string text = RandomDocument(static_cast<uint32_t>(_random())).text();
    modelOf(parsed(text).get());
  }

  void setText(Model& model) {
    const std::u16string text = anyText();
    if (!model.isBranch()) {
      _strings.emplace_back(model.node->stringValue(), model.text);
      model.node->setStringValue(viewOf(text));
      model.text = text;
      return;
    }
    model.node->setStringValue(viewOf(text));
    for (Model* child : model.children) child->parent = nullptr;
    model.children.clear();
    if (text.empty()) return;
    Model* const child = added(Kind::Text, "", text, model.node->firstChild());
    child->parent = &model;
    model.children.push_back(child);
  }

  static void number(Model& model, std::vector<const Model*>& order) {
    order.push_back(&model);
    for (Model* each : model.namespaces) order.push_back(each);
    for (Model* each : model.attributes) order.push_back(each);
    for (Model* each : model.children) number(*each, order);
  }

  static void compareOrder(Model& a, Model& b) {
    const bool haveOneRoot = a.root() == b.root();
    ASSERT_EQ(NSXMLNodeOrder::areComparable(a.node.get(), b.node.get()), haveOneRoot);
    if (!haveOneRoot) return;
    std::vector<const Model*> order;
    number(*a.root(), order);
    const auto placeOf = [&](const Model& model) {
      return std::find(order.begin(), order.end(), &model) - order.begin();
    };
    const ptrdiff_t difference = placeOf(a) - placeOf(b);
    ASSERT_EQ(NSXMLNode::compareOrder(a.node.get(), b.node.get()),
              difference < 0 ? -1 : difference > 0);
  }

  static void expectSame(const Model& model) {
    ASSERT_NO_FATAL_FAILURE(expectSame(model, model.node.get()));
  }
  // Those of the model itself and what is below; of a copy, whatever node it is.
  static void expectSame(const Model& model, const NSXMLNode* node) {
    const bool isCopy = model.node.get() != node;
    ASSERT_EQ(node->kind(), model.kind);
    ASSERT_EQ(node->hasName() ? node->nameView().utf8() : "", model.name);
    ASSERT_EQ(node->textView().utf16(), model.text);
    if (!isCopy) {
      ASSERT_EQ(node->parent(), model.parent ? model.parent->node.get() : nullptr);
    }
    const auto* element = dyn_cast<NSXMLElement>(node);
    const NSXMLNode* property = element ? NSXMLTree::firstPropertyOf(element) : nullptr;
    for (const auto* list : {&model.namespaces, &model.attributes}) {
      for (const Model* each : *list) {
        ASSERT_TRUE(property);
        if (!isCopy) {
          ASSERT_EQ(property, each->node.get());
        }
        ASSERT_EQ(property->parent(), node);
        ASSERT_NO_FATAL_FAILURE(expectSame(*each, property));
        property = NSXMLTree::nextProperty(property);
      }
    }
    ASSERT_EQ(property, nullptr);
    const NSXMLNode* child = node->firstChild();
    const NSXMLNode* previous = nullptr;
    for (const Model* each : model.children) {
      ASSERT_TRUE(child);
      if (!isCopy) {
        ASSERT_EQ(child, each->node.get());
      }
      ASSERT_EQ(child->parent(), node);
      ASSERT_EQ(child->previousSibling(), previous);
      ASSERT_EQ(NSXMLTree::of(child), NSXMLTree::of(node));
      ASSERT_NO_FATAL_FAILURE(expectSame(*each, child));
      previous = child;
      child = child->nextSibling();
    }
    ASSERT_EQ(child, nullptr);
    ASSERT_EQ(node->lastChild(), previous);
  }

  std::mt19937 _random;
  std::vector<std::unique_ptr<Model>> _models;
  std::vector<std::pair<Ref<NSString>, std::u16string>> _strings;
};

TEST(XMLTreeModel, TreesAreWhatAPlainModelSays) {
  const int64_t bytes = workMeter.valueBytes;
  const size_t names = NSXMLInternedNameCount();
  for (uint32_t seed = 0; seed < 25; ++seed) {
    Forest forest(seed);
    for (int step = 0; step < 400; ++step) {
      ASSERT_NO_FATAL_FAILURE(forest.step()) << "seed " << seed << ", step " << step;
    }
    ASSERT_NO_FATAL_FAILURE(forest.expectAllSame()) << "seed " << seed;
  }
  EXPECT_EQ(NSXMLInternedNameCount(), names);
  EXPECT_EQ(workMeter.valueBytes, bytes) << "what trees took has been counted off";
}

}  // namespace
}  // namespace xquery
