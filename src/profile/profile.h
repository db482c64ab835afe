// The profile library: parameter files of the processing libraries.
#pragma once

#include "profile/profile_cache.h"
#include "profile/profile_checked.h"
#include "profile/profile_par.h"
#include "profile/profile_values.h"
