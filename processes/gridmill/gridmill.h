#pragma once

/// All operators of the library.

#include "processes/gridmill/averagechannels.h"
#include "processes/gridmill/filterasp.h"
#include "processes/gridmill/filterslp.h"
