#!/usr/bin/env bash
# The include graph of the reference engine's sources (reference-engine/src):
# every pair "file included-file" between its own files, then the same graph
# between folders, and the folders by layer (a folder's layer is one above
# the highest it includes from). Fails, with tsort naming the loop, when
# either graph has a circle: a file reaching itself through its includes, or
# a folder including from one that includes from it.
set -euo pipefail
cd "$(dirname "$0")/../reference-engine/src"

files=$(grep -o '^#include "[^"]*"' -r --include='*.h' --include='*.cpp' . |
  sed 's#^\./##; s#:\#include "# #; s#"$##' |
  while read -r from to; do if [ -f "$to" ]; then echo "$from $to"; fi; done | sort -u)
folders=$(echo "$files" | awk '{ split($1, a, "/"); split($2, b, "/"); if (a[1] != b[1]) print a[1], b[1] }' | sort -u)

echo "# files: includer included"
echo "$files"
echo "$files" | tsort >/dev/null
echo "# folders: includer included"
echo "$folders"
order=$(echo "$folders" | tsort | tac)
echo "# folder layers, lowest first"
{ echo "$folders"; echo "--"; echo "$order"; } | awk '
  $0 == "--" { ordered = 1; next }
  !ordered { uses[$1] = uses[$1] " " $2; next }
  { layer = 0; n = split(uses[$1], below, " ")
    for (i = 1; i <= n; i++) if (level[below[i]] + 1 > layer) layer = level[below[i]] + 1
    level[$1] = layer; names[layer] = names[layer] " " $1; if (layer > top) top = layer }
  END { for (l = 0; l <= top; l++) print l ":" names[l] }'
