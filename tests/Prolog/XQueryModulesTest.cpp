#include "Platform/Base/Counting.h"
#include "Prolog/PrologTesting.h"
#include "Prolog/XQueryModules.h"

#include <gtest/gtest.h>

#include <memory>
#include <thread>

namespace xquery {
namespace {

struct BuiltinRow {
  int64_t id;
  const char* URI;
};

const BuiltinRow builtinRows[] = {
    {1, "http://www.w3.org/2004/10/xpath-functions/collation/codepoint"},
    {2, "http://www.w3.org/2004/10/xquery-local-functions"},
    {3, "http://www.w3.org/XML/1998/namespace"},
    {4, "http://www.w3.org/2000/xmlns"},
    {5, "http://www.w3.org/2001/XMLSchema"},
    {6, "http://www.w3.org/2001/XMLSchema-instance"},
    {7, "http://www.w3.org/2004/10/xpath-functions"},
    {8, "http://www.w3.org/2004/10/xpath-datatypes"},
    {9, "http://www.w3.org/2004/10/xqt-errors"},
    {10, "http://libxquery.example/xquery/2004/10/functions"},
    {11, "http://www.w3.org/1999/xhtml"},
};

TEST(Modules, EveryBuiltinNamespaceHasItsID) {
  const auto modules = XQueryModules::modules();
  for (const auto& row : builtinRows) {
    EXPECT_EQ(shown(XQueryModules::builtinNamespaceForID(row.id)), row.URI);
    EXPECT_EQ(shown(modules->namespaceForID(row.id)), row.URI);
    EXPECT_EQ(modules->namespaceID(text(row.URI), false), row.id);
    EXPECT_EQ(modules->namespaceID(text(row.URI), true), row.id);
  }
}

TEST(Modules, BuiltinNamespacesAreSharedObjects) {
  EXPECT_EQ(XQueryModules::builtinNamespaceForID(7), XQueryModules::builtinNamespaceForID(7));
  EXPECT_TRUE(NSCounting::isImmortal(*XQueryModules::builtinNamespaceForID(7)));
}

TEST(Modules, NoBuiltinNamespaceOutsideOneToEleven) {
  for (const int64_t id : {INT64_MIN, int64_t{-1}, int64_t{0}, int64_t{12}, INT64_MAX}) {
    EXPECT_EQ(shown(XQueryModules::builtinNamespaceForID(id)), "(none)") << id;
  }
}

TEST(Modules, NewNamespacesCountFromTwelve) {
  const auto modules = XQueryModules::modules();
  EXPECT_EQ(modules->namespaceID(text("urn:a"), true), 12);
  EXPECT_EQ(modules->namespaceID(text("urn:b"), true), 13);
  EXPECT_EQ(modules->namespaceID(text("urn:a"), true), 12);
  EXPECT_EQ(modules->namespaceID(text("urn:b"), false), 13);
  EXPECT_EQ(shown(modules->namespaceForID(12)), "urn:a");
  EXPECT_EQ(shown(modules->namespaceForID(13)), "urn:b");
}

TEST(Modules, UnknownNamespaceWithoutCreationIsZero) {
  const auto modules = XQueryModules::modules();
  EXPECT_EQ(modules->namespaceID(text("urn:a"), false), 0);
  EXPECT_EQ(modules->namespaceID(text("urn:a"), true), 12);
}

TEST(Modules, NoNamespaceIsNeverRegistered) {
  const auto modules = XQueryModules::modules();
  EXPECT_EQ(modules->namespaceID(nullptr, true), 0);
  EXPECT_EQ(modules->namespaceID(text("urn:a"), true), 12);
}

TEST(Modules, NamespaceForIDIsNullAtZeroAndPastTheEnd) {
  const auto modules = XQueryModules::modules();
  for (const int64_t id : {INT64_MIN, int64_t{-1}, int64_t{0}, int64_t{12}, INT64_MAX}) {
    EXPECT_EQ(shown(modules->namespaceForID(id)), "(none)") << id;
  }
}

TEST(Modules, EmptyNamespaceHasAnIDButNoText) {
  const auto modules = XQueryModules::modules();
  EXPECT_EQ(modules->namespaceID(NSString::empty(), true), 12);
  EXPECT_EQ(shown(modules->namespaceForID(12)), "(none)");
  EXPECT_EQ(modules->namespaceID(text("urn:a"), true), 13);
}

TEST(Modules, RegistriesAreIndependent) {
  const auto first = XQueryModules::modules();
  const auto second = XQueryModules::modules();
  EXPECT_EQ(first->namespaceID(text("urn:a"), true), 12);
  EXPECT_EQ(second->namespaceID(text("urn:b"), true), 12);
  EXPECT_EQ(shown(first->namespaceForID(12)), "urn:a");
  EXPECT_EQ(first->namespaceID(text("urn:b"), false), 0);
}

TEST(Modules, PrologsAreKeptByID) {
  const OwnRegistry modules;
  EXPECT_EQ(modules->prologForID(12), nullptr);
  const auto prolog = prologOf({});
  modules->addProlog(prolog, 13);
  EXPECT_EQ(modules->prologForID(13), prolog.get());
  for (const int64_t id : {INT64_MIN, int64_t{-1}, int64_t{0}, int64_t{12}, int64_t{14}, INT64_MAX})
    EXPECT_EQ(modules->prologForID(id), nullptr) << id;
}

TEST(Modules, ALaterPrologReplacesTheOneBefore) {
  const OwnRegistry modules;
  const auto first = prologOf({moduleNamespace("m", "urn:m")}, modules);
  EXPECT_EQ(modules->prologForID(12), first.get());
  const auto second = prologOf({moduleNamespace("m", "urn:m")}, modules);
  EXPECT_EQ(modules->prologForID(12), second.get());
}

TEST(Modules, AReplacedPrologLivesAsLongAsTheRegistry) {
  const OwnRegistry modules;
  const XQueryProlog* first = prologOf({moduleNamespace("m", "urn:m")}, modules).get();
  prologOf({moduleNamespace("m", "urn:m")}, modules);
  EXPECT_NE(modules->prologForID(12), first);
  EXPECT_EQ(shown(first->modulePrefix()), "m");
}

TEST(Modules, AModuleThatMadeTheRegistryIsForgottenWhenItGoes) {
  Ref<XQueryModules> modules;
  {
    const auto prolog = prologOf({moduleNamespace("m", "urn:m")});
    modules = &prolog->modules();
    EXPECT_EQ(modules->prologForID(12), prolog.get());
  }
  EXPECT_EQ(modules->prologForID(12), nullptr);
}

TEST(Modules, APrologKeepsItsRegistry) {
  Ref<XQueryProlog> module;
  {
    const auto main = prologOf({});
    const Ref<XQueryModules> modules = &main->modules();
    module = prologOf({moduleNamespace("m", "urn:m")}, modules);
    EXPECT_EQ(modules->prologForID(12), module.get());
  }
  EXPECT_TRUE(NSCounting::hasOneReference(*module));
  EXPECT_EQ(module->namespaceID(text("urn:m")), 12);
}

// An expression that tells whether it still exists.
Ref<XQueryExpr> witnessed(std::weak_ptr<int>& witness) {
  auto token = std::make_shared<int>(0);
  witness = token;
  return probe([token](XQueryProlog&) {});
}

TEST(Modules, AMainModuleAndItsLibrariesGoTogether) {
  std::weak_ptr<int> inMain;
  std::weak_ptr<int> inLibrary;
  {
    const auto main = prologOf({variable("x", witnessed(inMain))});
    const Ref<XQueryModules> modules = &main->modules();
    prologOf({moduleNamespace("m", "urn:m"), variable("m:x", witnessed(inLibrary))}, modules);
    EXPECT_FALSE(inMain.expired());
    EXPECT_FALSE(inLibrary.expired());
  }
  EXPECT_TRUE(inMain.expired());
  EXPECT_TRUE(inLibrary.expired());
}

TEST(Modules, ALibraryModuleCompiledAloneGoes) {
  std::weak_ptr<int> witness;
  {
    const auto module =
        prologOf({moduleNamespace("m", "urn:m"), variable("m:x", witnessed(witness))});
    EXPECT_FALSE(witness.expired());
  }
  EXPECT_TRUE(witness.expired());
}

TEST(Modules, BuiltinTablesCanBeReadByManyThreads) {
  std::vector<std::thread> threads;
  std::vector<int64_t> sums(4);
  for (auto& sum : sums) {
    threads.emplace_back([&sum] {
      const auto modules = XQueryModules::modules();
      for (const auto& row : builtinRows) sum += modules->namespaceID(text(row.URI), true);
      sum += modules->namespaceID(text("urn:a"), true);
    });
  }
  for (auto& thread : threads) thread.join();
  EXPECT_EQ(sums, (std::vector<int64_t>{78, 78, 78, 78}));
}

}  // namespace
}  // namespace xquery
