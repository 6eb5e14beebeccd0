// The toolkit's registries against their models, the walks of RegistryModelsTest.
#include "support/FuzzModels.h"
#include "support/RegistryModels.h"

using namespace models;

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size) {
  return fuzzModels<ObjectsModel, PassesModel, ClassesModel, ConfigsModel>(data, size);
}
