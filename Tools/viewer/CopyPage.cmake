# Copies what the page is built from below BUILD, where its packages are installed. What is not there any more goes.
set(page ${BUILD}/Tools/viewer/page)
file(REMOVE_RECURSE ${page}/src ${page}/test ${page}/licences ${page}/dist)
file(COPY ${SOURCE}/Tools/viewer/page/ DESTINATION ${page}
  PATTERN node_modules EXCLUDE
  PATTERN dist EXCLUDE
  PATTERN "package*.json" EXCLUDE
  PATTERN .npmrc EXCLUDE)
file(COPY ${SOURCE}/Bindings/JavaScript/zulmetadata.d.ts DESTINATION ${BUILD}/Bindings/JavaScript)
