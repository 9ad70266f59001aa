#!/usr/bin/env bash
# Builds the documentation as a site in build/docs/html, and checks that every link leads somewhere. Fails if a public
# name has no description. Usage: scripts/docs.sh; the variable BUILD names a folder to use instead of build/docs.
set -euo pipefail
cd "$(dirname "$0")/.."
build=${BUILD:-build/docs}

scripts/install.sh docs

echo "== the pages"
rm -rf "$build"
mkdir -p "$build/theme" "$build/html"
python3 Docs/site/stage.py "$build/source"
cp Docs/site/mkdocs.yml "$build/"
cp Docs/site/main.html Docs/site/links.html Docs/site/site.css Docs/site/search.js "$build/theme/"
/usr/bin/mkdocs --quiet build -f "$build/mkdocs.yml"
python3 Docs/site/index_pages.py "$build/html"

echo "== the classes"
api=$build/html/api
mkdir -p "$api"
headers=()
for folder in SharedDependencies ZULMetaData Platform ZULMetaDataBridge ZULMetaDataSession; do # their headers are installed
    mapfile -t names < <(sed -nE 's|^ +([A-Za-z0-9_/]+\.h)\)?$|\1|p' "$folder/CMakeLists.txt")
    headers+=("${names[@]/#/$folder/}")
done
version=$(sed -nE 's/^project\(ZULMetaData VERSION ([0-9.]+).*/\1/p' CMakeLists.txt)
# The links of the site, relative to the folder of the classes.
sed "s|href=\"|&\$relpath^../|" Docs/site/links.html >"$build/links.html"
sed -e "/{links}/{r $build/links.html" -e 'd}' Docs/site/header.html >"$build/header.html"
ZULM_HEADERS="${headers[*]}" ZULM_VERSION=$version ZULM_API_FOLDER=$api ZULM_HTML_HEADER=$build/header.html ZULM_ROOT=$PWD \
    doxygen Docs/site/Doxyfile
# Doxygen links to lists of classes that it leaves out because they are private.
grep -lr 'href="#nested-classes"' "$api" | xargs grep -L 'name="nested-classes"' |
    xargs -r sed -i '/<a href="#nested-classes">/d'

echo "== the links"
python3 Docs/site/check_links.py "$build/html"
echo "Open $build/html/index.html"
