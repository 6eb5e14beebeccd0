// The toolkit's registries under random operations, against simple models: support/RegistryModels.h
// says which. The fuzz target FuzzRegistries takes the same walks.
#include "support/RegistryModels.h"

#include <gtest/gtest.h>

#include "support/ModelTest.h"

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
