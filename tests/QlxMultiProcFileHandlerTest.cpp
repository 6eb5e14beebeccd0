#include "QlxMultiProcFileHandler.h"

#include "support/FileHandlerFixture.h"
