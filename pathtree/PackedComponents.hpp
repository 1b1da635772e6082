#pragma once

#include "pathtree/ComponentArena.hpp"

namespace tessel {

using PackedComponents = ComponentList;
using ComponentPacker = ComponentArena;

}  // namespace tessel
