// Every container under random operations, against a simple model: support/ContainerModels.h says
// which. The fuzz target FuzzContainers takes the same walks.
#include "support/ContainerModels.h"

#include <gtest/gtest.h>

#include "support/ModelTest.h"

namespace {

using namespace models;

template <typename Model>
class ContainerModelTest : public ::testing::Test {};

struct ApiNames {
  template <typename Model>
  static std::string GetName(int) {
    return Model::kName;
  }
};

using Models =
    ::testing::Types<GroupModel<QlxStringGroupApi>, GroupModel<QlxListenerGroupApi>,
                     ListModel<QlxStringListApi>, ListModel<QlxParmListApi>,
                     MapModel<QlxStringToStringMapApi>, MapModel<QlxStringToObjMapApi>,
                     MapModel<QlxStringToObjCfgMapApi>, MapModel<QlxStringToObjClassMapApi>>;
TYPED_TEST_SUITE(ContainerModelTest, Models, ApiNames);

TYPED_TEST(ContainerModelTest, IsLikeTheModelThroughRandomOperations) {
  walk<TypeParam>(100000);
}

}  // namespace
