#!/bin/sh
# Fetches Debian's wallpaper packages (face-free photos and artwork) and
# extracts their pictures into DATA_DIR/wallpapers as extra face negatives.
# The images are used for training only and never committed.
# Usage: tools/face_training/get_wallpapers.sh DATA_DIR
set -eu
data=${1:?usage: get_wallpapers.sh DATA_DIR}
tmp=$(mktemp -d)
trap 'rm -rf "$tmp"' EXIT
mkdir -p "$data/wallpapers"
cd "$tmp"
for p in ukui-wallpapers mate-backgrounds gnome-backgrounds plasma-workspace-wallpapers desktop-base; do
  apt-get download "$p" || echo "skipped $p (not available)"
done
for d in *.deb; do dpkg-deb -x "$d" root; done
# One picture per wallpaper (the largest of a contents/images* folder: some
# packages ship one wallpaper in several sizes), no previews, nothing tiny.
find root -type f \( -iname '*.jpg' -o -iname '*.jpeg' -o -iname '*.png' \) ! -iname 'screenshot*' -size +60k \
  -printf '%s %h %p\n' | sed 's#/contents/images[^ ]* # #' | sort -k2,2 -k1,1nr |
  awk '{key = $2 ~ /\/contents$/ ? $2 : $3} !seen[key]++ {print $3}' | sort >list
n=0
while read -r f; do
  n=$((n + 1))
  ext=$(echo "${f##*.}" | tr 'A-Z' 'a-z')
  cp "$f" "$data/wallpapers/$(printf '%04d' "$n").$ext"
done <list
echo "$(ls "$data/wallpapers" | wc -l) pictures in $data/wallpapers"
