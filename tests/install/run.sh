#!/usr/bin/env bash
# Installs a build to temporary folders, once with --prefix and once with DESTDIR, checks what was installed, builds hosts
# and a plug-in against it, and converts with all of them. Also builds users of the source tree as a subproject. Works for
# every layout, with libraries in lib or in lib/<architecture>: run.sh BUILD_DIR SOURCE_DIR CMAKE
set -euo pipefail

build=$1 source=$2 cmake=$3
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT
unset TONEWRIGHT_PLUGIN_PATH TONEWRIGHT_COMPANION_PATH TONEWRIGHT_LIBRARY LD_LIBRARY_PATH
fail() { echo "$*" >&2; exit 1; }
quietly() { "$@" >"$work/log" 2>&1 || { cat "$work/log"; fail "failed: $*"; }; }

cd "$work"
sox -n -r 44100 -c 2 -b 16 tone.wav synth 1 sine 440

# Nothing refers to the build tree or to the working directory, and everything finds its libraries by itself.
check_binary() {
    local path dynamic
    dynamic=$(readelf -Wd "$1")
    path=$(sed -n 's/.*runpath: \[\(.*\)\]/\1/p' <<<"$dynamic")
    [[ $path =~ ^(\$ORIGIN[^:]*(:\$ORIGIN[^:]*)*)?$ ]] || fail "run path of $1: '$path'"
    ! ldd "$1" | grep 'not found' || fail "$1 lacks libraries"
    grep -q '^TONEWRIGHT_HARDENING:BOOL=ON' "$build/CMakeCache.txt" || return 0
    [[ $dynamic == *NOW* && $dynamic != *TEXTREL* ]] || fail "$1 is not bound at start-up"
    [[ $(readelf -Wl "$1") =~ 'file type is DYN'.*GNU_STACK\ +[^$'\n']*RW\ +[^$'\n']*$'\n'.*GNU_RELRO ]] ||
        fail "$1: fixed addresses, an executable stack, or writable relocations"
    [[ $(readelf -Ws --dyn-syms "$1") == *__stack_chk_fail* ]] || fail "$1 has no stack protector"
}

# Pages and completions describe every command and every option that the program has.
check_command() {
    local root=$1 name="$*" page help option child
    page=$prefix/share/man/man1/${name// /-}.1
    help=$("$prefix/bin/$root" "${@:2}" --help)
    [[ ! -e $page.gz ]] || { gunzip -c "$page.gz" >page; page=page; }
    [[ -s $page ]] || fail "no manual page for $name"
    if command -v groff >/dev/null; then
        [[ -z $(groff -man -ww -z -Tutf8 "$page" 2>&1) ]] || fail "groff warns about the manual page of $name"
    fi
    for option in $(grep -oE '^  (-[a-zA-Z],)?--?[a-zA-Z0-9-]+' <<<"$help" | tr ',' ' '); do
        grep -qE -- "(^| )\\\\fB${option//-/\\\\-}\\\\fR" "$page" || fail "the manual page of $name lacks $option"
        [[ " $(complete_words "$@" -) " == *" $option "* ]] || fail "$name is not completed with $option"
    done
    for child in $(sed -n '/^Subcommands:/,/^$/s/^  \([a-z-]*\) .*/\1/p' <<<"$help"); do
        [[ " $(complete_words "$@" "") " == *" $child "* ]] || fail "$name is not completed with $child"
        check_command "$@" "$child"
    done
}
complete_words() {
    bash -c 'source "$0"; compopt() { :; }; COMP_WORDS=("$@") COMP_CWORD=$(($# - 1)); "_${1//-/_}"; echo "${COMPREPLY[*]}"' \
        "$prefix/share/bash-completion/completions/$1" "$@"
}

for way in prefix destdir; do
    if [[ $way == prefix ]]; then
        quietly "$cmake" --install "$build" --prefix "$work/prefix"
        root=
    else
        DESTDIR=$work/root quietly "$cmake" --install "$build"
        root=$work/root
    fi
    program=$(find "${root:-$work/prefix}" -path '*/bin/tonewright')
    prefix=${program%/bin/tonewright}
    library=$(find "$prefix" -name 'libtonewright.so')
    libdir=${library%/libtonewright.so}

    while read -r file; do check_binary "$file"; done < <(find "$prefix" -type f -perm -u+x -o -name '*.so*' -type f)
    ! grep -rl '\.\./\|/posix/' "$prefix/include" "$libdir/pkgconfig" || fail "relative or internal paths are installed"
    if [[ -d $prefix/share/bash-completion ]]; then
        check_command tonewright
        check_command tonewright-covers
    fi
    # Packages without the program for covers must not need a user interface toolkit.
    for file in "$program" "$library" "$libdir"/libtonewright_host.so; do
        [[ ! $(ldd "$file") =~ libgtk|libwx|libcairo ]] || fail "$file loads a user interface toolkit"
    done

    # pkg-config puts DESTDIR in front of the paths, as a build of a dependent package does.
    compile() {
        local flags
        read -ra flags < <(PKG_CONFIG_SYSROOT_DIR=$root PKG_CONFIG_PATH=$libdir/pkgconfig \
            PKG_CONFIG_ALLOW_SYSTEM_CFLAGS=1 PKG_CONFIG_ALLOW_SYSTEM_LIBS=1 pkg-config --cflags --libs "$1")
        quietly cc -std=c11 -Wall -Wextra -Werror "$2" -o "$3" "${flags[@]}" "-Wl,-rpath,$libdir"
    }
    compile tonewright "$source/host.c" by-pkg-config
    compile tonewright-host "$source/support.c" support
    quietly ./support
    for host in ./by-pkg-config "$program convert --force -o"; do
        rm -f tone.flac
        if [[ $host == *-o ]]; then quietly $host tone.flac tone.wav; else quietly $host tone.wav tone.flac; fi
        flac -t -s tone.flac
    done
done

# The rest uses the last copy, and the examples as they are installed.
examples=$prefix/share/doc/tonewright/docs/examples
for project in "$source/host" "$source/cpp" "$examples/plugin"; do
    quietly "$cmake" -S "$project" -B "$work/$(basename "$project")" -G Ninja "-DCMAKE_PREFIX_PATH=$prefix" "-DEXAMPLES=$examples"
    quietly "$cmake" --build "$work/$(basename "$project")"
done
quietly "$cmake" -S "$source/subproject" -B "$work/enclosing" -G Ninja "-DEXAMPLES=$source/../../docs/examples"
quietly "$cmake" --build "$work/enclosing" --target users

quietly python3 "$examples/showcase.py" showcase.xml
quietly "$prefix/bin/tonewright-covers" render showcase.xml -o showcase.pdf
[[ $(pdftotext showcase.pdf -) == *"Every element"* ]] || fail "tonewright-covers paints no text"

rm tone.flac
quietly host/host tone.wav tone.flac
flac -t -s tone.flac

# A plug-in in a folder of the search path both reads and writes; the standard plug-ins may be there as well.
plugins=$(dirname "$(find "$prefix" -name sonora2_wav.so)")
export TONEWRIGHT_PLUGIN_PATH=$work/plugin:$plugins:$build/lib
quietly "$program" convert tone.flac -o tone.s16
quietly "$program" convert tone.s16 -o back.wav
cmp <(sox tone.wav -t raw -) tone.s16
cmp <(sox tone.wav -t raw -) <(sox back.wav -t raw -)

ffmpeg -v error -f lavfi -i color=red:s=16x16 -frames:v 1 red.png
cpp/covers add tone.flac red.png
cpp/covers list tone.flac | grep -q "^0 front image/png"
[[ $(cpp/record 2>&1) == usage* ]] || fail "the recorder does not start"
quietly host/tag "$work/tone.flac" "A title"
[[ $(metaflac --show-tag=TITLE tone.flac) == "TITLE=A title" ]] || fail "the tag example sets no title"
TONEWRIGHT_LIBDIR=$libdir quietly python3 "$examples/convert.py" tone.flac tone.ogg
[[ $(ogginfo tone.ogg) == *'Playback length: 0m:01'* ]] || fail "convert.py writes no Ogg Vorbis file"
