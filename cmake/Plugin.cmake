# What the plug-in owes its host as a shared object: a version, and no symbol
# outside but its two entry points.
set_target_properties(
  qztessel
  PROPERTIES VERSION ${PROJECT_VERSION}
             SOVERSION ${PROJECT_VERSION_MAJOR}
             CXX_VISIBILITY_PRESET hidden
             VISIBILITY_INLINES_HIDDEN ON)
