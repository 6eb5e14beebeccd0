#include "Variants.h"

#include <algorithm>

static constexpr const char *kRolling = "qlx_filehandler";
static constexpr const char *kShared = "qlx_multiproc_filehandler";

// Deliberate: by default the shared file is emptied whatever became of its copy. What that loses
// is counted apart; with "keepFullFile" nothing may be lost.
static const Variant kVariants[] = {
    {.name = "rolling", .handlerClass = kRolling, .earlier = true},
    {.name = "framed",
     .handlerClass = kRolling,
     .form = Form::kFramedLine,
     .freshFolder = true,
     .reconfigures = true},
    {.name = "xml",
     .handlerClass = kRolling,
     .form = Form::kXml,
     .records = 120,
     .maxFileBytes = "1800"},
    {.name = "emptying", .handlerClass = kRolling, .settings = {{"appending", "false"}}},
    {.name = "following",
     .handlerClass = kRolling,
     .settings = {{"appending", "false"}, {"followName", "true"}}},
    {.name = "rollingCut", .handlerClass = kRolling, .cutWhen = "7+7"},
    {.name = "shared",
     .handlerClass = kShared,
     .writers = 3,
     .records = 70,
     .earlier = true,
     .reconfigures = true,
     .mayLoseCopies = true},
    {.name = "sharedKeep",
     .handlerClass = kShared,
     .writers = 3,
     .records = 70,
     .earlier = true,
     .reconfigures = true,
     .settings = {{"keepFullFile", "true"}}},
    {.name = "sharedCut",
     .handlerClass = kShared,
     .writers = 3,
     .records = 70,
     .cutWhen = "7+7",
     .settings = {{"keepFullFile", "true"}}},
};

const Variant *findVariant(std::string_view name) {
  const auto *const found = std::find_if(std::begin(kVariants), std::end(kVariants),
                                         [name](const Variant &row) { return name == row.name; });
  return found == std::end(kVariants) ? nullptr : found;
}

std::string variantNames() {
  std::string names;
  for (const Variant &variant : kVariants)
    names += (names.empty() ? "" : " ") + std::string(variant.name);
  return names;
}
