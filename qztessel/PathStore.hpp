#pragma once

// A list that grows, in memory: see paths/PathStore.hpp.
#include "paths/PathStore.hpp"
