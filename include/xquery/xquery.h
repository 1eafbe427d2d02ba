// Everything a host program needs.
#pragma once

#include "xquery/Collection.h"
#include "xquery/Data.h"
#include "xquery/Date.h"
#include "xquery/Error.h"
#include "xquery/Limits.h"
#include "xquery/Loading.h"
#include "xquery/Memory.h"
#include "xquery/Number.h"
#include "xquery/Object.h"
#include "xquery/Serializing.h"
#include "xquery/Stream.h"
#include "xquery/String.h"
#include "xquery/URL.h"
#include "xquery/Warnings.h"
#include "xquery/XMLNode.h"
#include "xquery/XQuery.h"
