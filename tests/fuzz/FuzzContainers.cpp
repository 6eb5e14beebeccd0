// Every container and the property list against their models, the walks of ContainerModelsTest.
#include "support/ContainerModels.h"
#include "support/FuzzModels.h"
#include "support/PropListModel.h"

using namespace models;

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size) {
  return fuzzModels<
      GroupModel<QlxStringGroupApi>, GroupModel<QlxListenerGroupApi>, ListModel<QlxStringListApi>,
      ListModel<QlxParmListApi>, MapModel<QlxStringToStringMapApi>, MapModel<QlxStringToObjMapApi>,
      MapModel<QlxStringToObjCfgMapApi>, MapModel<QlxStringToObjClassMapApi>, PropListModel>(data,
                                                                                             size);
}
