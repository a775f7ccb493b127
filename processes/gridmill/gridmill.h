#pragma once

/// All operators of the library.

#include "processes/gridmill/averagechannels.h"
#include "processes/gridmill/bitmapfiltering.h"
#include "processes/gridmill/chandiffchange.h"
#include "processes/gridmill/chandiffchange2.h"
#include "processes/gridmill/chanratiochange.h"
#include "processes/gridmill/chanratiochange2.h"
#include "processes/gridmill/combchange.h"
#include "processes/gridmill/filterasp.h"
#include "processes/gridmill/filterslp.h"
#include "processes/gridmill/intenpercent.h"
#include "processes/gridmill/intenratiochange.h"
#include "processes/gridmill/magnitudechange.h"
#include "processes/gridmill/mirrorimg.h"
#include "processes/gridmill/normalize.h"
#include "processes/gridmill/percentile.h"
#include "processes/gridmill/singlechange.h"
#include "processes/gridmill/sqrgradient.h"
#include "processes/gridmill/tasseledcapchange.h"
#include "processes/gridmill/vegindex.h"
#include "processes/gridmill/vollath.h"
