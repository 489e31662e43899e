#!/bin/sh
# SPDX-License-Identifier: Apache-2.0
# Renders the pictures under icons/ from the drawings under svg/ and writes the resource list.
# To be run after a drawing was added or changed; needs rsvg-convert (librsvg2-bin).
set -eu
cd "$(dirname "$0")"

# One line a size: the sizes in pixels and the names of the drawings that exist at that size.
names16="about bulb cancel debug delete device_busy device_offline device_online drive exit file_ascii
         file_binary file_settings file_waveform fileclose folder
         folder_new home next prev redflag refresh rename run yellowled"
names22="attach refresh"
names32="cancel drive file_ascii file_binary file_settings file_waveform folder"

drawing() {
    if [ -f "svg/own/$1.svg" ]; then echo "svg/own/$1.svg"; else echo "svg/tango/$1.svg"; fi
}

render() { # NAME PIXELS FILE
    rsvg-convert --width "$2" --height "$2" --keep-aspect-ratio "$(drawing "$1")" --output "$3"
}

rm -rf icons
{
    echo '<!-- Written by render-icons.sh. -->'
    echo '<RCC>'
    echo '  <qresource prefix="/">'
    for size in 16 22 32; do
        mkdir -p "icons/$size"
        eval "names=\$names$size"
        for name in $names; do
            render "$name" "$size" "icons/$size/$name.png"
            render "$name" $((2 * size)) "icons/$size/$name@2x.png"
            for file in "$name.png" "$name@2x.png"; do
                echo "    <file alias=\"icons$size/$file\">icons/$size/$file</file>"
            done
        done
    done
    # Trees and lists of files take theirs from a folder of its own.
    for file in drive file_ascii file_binary file_settings file_waveform folder; do
        for suffix in "" "@2x"; do
            echo "    <file alias=\"icons32/Resources/$file$suffix.png\">icons/32/$file$suffix.png</file>"
        done
    done
    mkdir -p icons/16
    for suffix in "" "@2x"; do
        echo "    <file alias=\"icons16/Resources/cancel$suffix.png\">icons/16/cancel$suffix.png</file>"
    done
    mkdir -p icons/program
    for size in 16 32 48 64 128 256; do
        render corvane "$size" "icons/program/corvane-$size.png"
        echo "    <file alias=\"program/corvane-$size.png\">icons/program/corvane-$size.png</file>"
    done
    echo '  </qresource>'
    echo '</RCC>'
} >corvane.qrc
