// An engine of nothing but the required functions, reporting TEST_ENGINE_VERSION.
#include "test_engine.h"

TEST_ENGINE_REQUIRED_FUNCTIONS(TEST_ENGINE_VERSION)
