// The toolkit's registries against their models, the walks of RegistryModelsTest.
#include "support/ClassesModel.h"
#include "support/ConfigsModel.h"
#include "support/FuzzModels.h"
#include "support/ObjectsModel.h"
#include "support/PassesModel.h"

using namespace models;

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size) {
  return fuzzModels<ObjectsModel, PassesModel, ClassesModel, ConfigsModel>(data, size);
}
