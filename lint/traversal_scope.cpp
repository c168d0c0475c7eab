// Keeps clang-tidy out of the system's headers. Its matchers visit every declaration of a source's translation unit,
// and what they find in a system header is thrown away; with the index library's headers that is nine tenths of the
// work. Loaded into clang-tidy, this sets the scope of the visits to the declarations of our own files before the
// checks begin. The static analyzer looks for its functions itself and sees no difference.
//
// One check compares across files: a class of ours that is declared and never defined is reported where another
// namespace has one of the same name. So whatever in a system header names such a class stays in scope.

#include <llvm/ADT/SetVector.h>

#include <clang/AST/ASTConsumer.h>
#include <clang/AST/ASTContext.h>
#include <clang/AST/DeclCXX.h>
#include <clang/AST/ExternalASTSource.h>
#include <clang/Basic/SourceManager.h>
#include <clang/Frontend/CompilerInstance.h>
#include <clang/Frontend/FrontendAction.h>
#include <clang/Frontend/FrontendPluginRegistry.h>
#include <memory>
#include <string>
#include <vector>

namespace {

using Declarations = llvm::SetVector<clang::Decl*>;
using Contexts = llvm::SetVector<clang::DeclContext*>;
using Names = llvm::SetVector<clang::DeclarationName>;

bool IsNamespace(clang::Decl::Kind kind) {
  return kind == clang::Decl::Namespace || kind == clang::Decl::LinkageSpec;
}

// The class itself, or those of a namespace, that have no definition.
void FindUndefinedClasses(const clang::Decl* declaration, Names& names) {
  if (const auto* const record = llvm::dyn_cast<clang::CXXRecordDecl>(declaration)) {
    if (!record->hasDefinition()) names.insert(record->getDeclName());
  } else if (IsNamespace(declaration->getKind())) {
    for (const clang::Decl* const inner : llvm::cast<clang::DeclContext>(declaration)->decls()) {
      FindUndefinedClasses(inner, names);
    }
  }
}

// The namespace, and all that stand in it. Of what is precompiled only namespaces are loaded: loading everything
// takes as long as all the checks.
void FindNamespaces(clang::DeclContext* context, clang::ExternalASTSource* precompiled, Contexts& found) {
  found.insert(context->getPrimaryContext());
  llvm::SmallVector<clang::Decl*> inside;
  if (context->hasExternalLexicalStorage()) {
    precompiled->FindExternalLexicalDecls(context, IsNamespace, inside);
  }
  for (clang::Decl* const inner : context->noload_decls()) {
    if (IsNamespace(inner->getKind())) inside.push_back(inner);
  }
  for (clang::Decl* const inner : inside) {
    FindNamespaces(llvm::cast<clang::DeclContext>(inner), precompiled, found);
  }
}

clang::Decl* OutermostAround(clang::Decl* declaration) {
  while (!declaration->getLexicalDeclContext()->isTranslationUnit()) {
    declaration = llvm::cast<clang::Decl>(declaration->getLexicalDeclContext());
  }
  return declaration;
}

// What declares a class of one of the names, wherever it is.
void AddNamesakes(clang::ASTContext& context, const Names& names, Declarations& scope) {
  Contexts namespaces;
  FindNamespaces(context.getTranslationUnitDecl(), context.getExternalSource(), namespaces);
  for (clang::DeclContext* const place : namespaces) {
    for (const clang::DeclarationName name : names) {
      for (clang::NamedDecl* const found : place->lookup(name)) {
        for (clang::Decl* const each : found->redecls()) scope.insert(OutermostAround(each));
      }
    }
  }
}

class ScopeSetter : public clang::ASTConsumer {
 public:
  // What a precompiled header brings does not come by here.
  bool HandleTopLevelDecl(clang::DeclGroupRef group) override {
    declarations_.insert(declarations_.end(), group.begin(), group.end());
    return true;
  }

  void HandleTranslationUnit(clang::ASTContext& context) override {
    const clang::SourceManager& sources = context.getSourceManager();
    Declarations scope;
    Names only_declared;
    for (clang::Decl* const declaration : declarations_) {
      if (sources.isInSystemHeader(sources.getExpansionLoc(declaration->getLocation()))) continue;
      scope.insert(declaration);
      FindUndefinedClasses(declaration, only_declared);
    }
    if (!only_declared.empty()) AddNamesakes(context, only_declared, scope);
    context.setTraversalScope(scope.takeVector());
  }

 private:
  std::vector<clang::Decl*> declarations_;
};

class SetTraversalScope : public clang::PluginASTAction {
 public:
  ActionType getActionType() override { return AddBeforeMainAction; }

 protected:
  std::unique_ptr<clang::ASTConsumer> CreateASTConsumer(clang::CompilerInstance& /*compiler*/,
                                                        llvm::StringRef /*file*/) override {
    return std::make_unique<ScopeSetter>();
  }

  bool ParseArgs(const clang::CompilerInstance& /*compiler*/,
                 const std::vector<std::string>& /*arguments*/) override {
    return true;
  }
};

const clang::FrontendPluginRegistry::Add<SetTraversalScope> registration("set-traversal-scope",
                                                                         "visit no system header");

}  // namespace
