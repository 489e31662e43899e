#!/bin/sh
# SPDX-License-Identifier: Apache-2.0
# Renders the program's icon in the sizes that desktops ask for. To be run after corvane.svg was
# changed; needs rsvg-convert (librsvg2-bin).
set -eu
cd "$(dirname "$0")"
for size in 16 32 48 64 128 256; do
    rsvg-convert --width "$size" --height "$size" svg/corvane.svg --output "program/corvane-$size.png"
done
