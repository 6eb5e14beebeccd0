// The toolkit's registries under random operations, against simple models. The fuzz target
// FuzzRegistries takes the same walks.
#include <gtest/gtest.h>

#include "support/ClassesModel.h"
#include "support/ConfigsModel.h"
#include "support/ModelTest.h"
#include "support/ObjectsModel.h"
#include "support/PassesModel.h"

namespace {

TEST(RegistryModelsTest, ObjectsAndListenersAreLikeTheModelThroughRandomOperations) {
  walk<models::ObjectsModel>(100000);
}

TEST(RegistryModelsTest, EventsReachWhomTheModelNamesThroughRandomChanges) {
  walk<models::PassesModel>(10000);  // each with an event and dozens of changes
}

TEST(RegistryModelsTest, ClassesAreLikeTheModelThroughRandomOperations) {
  walk<models::ClassesModel>(100000);
}

TEST(RegistryModelsTest, ConfigurationsAreLikeTheModelThroughRandomOperations) {
  walk<models::ConfigsModel>(100000);
}

}  // namespace
