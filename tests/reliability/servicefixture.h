// Moved to tests/common, shared with the service and themeletctl tests.
#include "../common/servicefixture.h"
