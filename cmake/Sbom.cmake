# Lists what a package is made of and needs, as an SPDX 2.3 document in JSON, so
# that whoever learns of a fault in a library can tell whether it reached them.
# Equal builds give equal documents.

# What ours is compiled with or linked to: Debian's package, its licence, and
# whether its code is inside of ours ("header") or loaded beside it ("dynamic").
set(sbomParts
    "libc6|LGPL-2.1-or-later|dynamic"
    "libcli11-dev|BSD-3-Clause|header"
    "libfmt9|MIT|dynamic"
    "libgcc-s1|GPL-3.0-or-later WITH GCC-exception-3.1|dynamic"
    "libre2-9|BSD-3-Clause|dynamic"
    "libstdc++6|GPL-3.0-or-later WITH GCC-exception-3.1|dynamic"
    "libxxhash-dev|BSD-2-Clause|header"
    "nlohmann-json3-dev|MIT|header"
    "pybind11-dev|BSD-3-Clause|header"
    "python3|Python-2.0|dynamic"
    "python3-numpy|BSD-3-Clause|dynamic"
    "zlib1g|Zlib|dynamic"
    "zlib1g-dev|Zlib|dynamic")

# The version of an installed Debian package; NOASSERTION where there is none.
function(qztesselDebianVersion result package)
  execute_process(
    COMMAND dpkg-query --show --showformat=\${Version} ${package}
    OUTPUT_VARIABLE version
    ERROR_QUIET)
  if(NOT version)
    set(version NOASSERTION)
  endif()
  set(${result} "${version}" PARENT_SCOPE)
endfunction()

# Writes the document of one of our packages.
#
#   output       the file
#   package      its name
#   date         the day of the release, YYYY-MM-DD
#   ARGN         Debian's packages in it and beside it, of those above
function(qztesselWriteSbom output package date)
  set(packages)
  set(relations)
  foreach(part IN LISTS sbomParts)
    string(REPLACE "|" ";" part "${part}")
    list(POP_FRONT part name licence role)
    if(NOT name IN_LIST ARGN)
      continue()
    endif()
    qztesselDebianVersion(version ${name})
    string(REPLACE "+" "%2B" locator "${name}@${version}")
    string(MAKE_C_IDENTIFIER ${name} id)
    string(REPLACE "_" "-" id ${id})
    string(APPEND packages ",
    {
      \"SPDXID\": \"SPDXRef-${id}\",
      \"name\": \"${name}\",
      \"versionInfo\": \"${version}\",
      \"downloadLocation\": \"NOASSERTION\",
      \"filesAnalyzed\": false,
      \"licenseDeclared\": \"${licence}\",
      \"externalRefs\": [{
        \"referenceCategory\": \"PACKAGE-MANAGER\",
        \"referenceType\": \"purl\",
        \"referenceLocator\": \"pkg:deb/debian/${locator}\"
      }]
    }")
    set(relation DEPENDS_ON)
    if(role STREQUAL "header")
      set(relation CONTAINS)
    endif()
    string(APPEND relations ",
    {
      \"spdxElementId\": \"SPDXRef-Package\",
      \"relationshipType\": \"${relation}\",
      \"relatedSpdxElement\": \"SPDXRef-${id}\"
    }")
  endforeach()
  # Two documents with different content may not share a name.
  string(SHA256 digest "${package}${packages}${relations}")
  file(
    CONFIGURE
    OUTPUT ${output}
    CONTENT
      "{
  \"spdxVersion\": \"SPDX-2.3\",
  \"dataLicense\": \"CC0-1.0\",
  \"SPDXID\": \"SPDXRef-DOCUMENT\",
  \"name\": \"${package}-${PROJECT_VERSION}\",
  \"documentNamespace\": \"https://qztessel.invalid/spdx/${package}-${PROJECT_VERSION}-${digest}\",
  \"creationInfo\": {
    \"created\": \"${date}T00:00:00Z\",
    \"creators\": [\"Organization: the libqztessel authors\"]
  },
  \"packages\": [
    {
      \"SPDXID\": \"SPDXRef-Package\",
      \"name\": \"${package}\",
      \"versionInfo\": \"${PROJECT_VERSION}\",
      \"downloadLocation\": \"NOASSERTION\",
      \"filesAnalyzed\": false,
      \"licenseDeclared\": \"BSD-3-Clause\"
    }${packages}
  ],
  \"relationships\": [
    {
      \"spdxElementId\": \"SPDXRef-DOCUMENT\",
      \"relationshipType\": \"DESCRIBES\",
      \"relatedSpdxElement\": \"SPDXRef-Package\"
    }${relations}
  ]
}
"
    @ONLY)
endfunction()
