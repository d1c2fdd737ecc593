#!/bin/sh
# usage: quit.sh KORRIN_SIM...
# `quit`, `exit` and `.quit` end the shell and a script: nothing after them
# runs. The shell's grid pads a CJK label by its terminal width (two columns
# a character), which `expect` does not compare.
set -eu
work=$(mktemp -d /tmp/korrin-quit-XXXXXX)
trap 'rm -rf "$work"' EXIT
cd "$work"
printf 'game com.jp.go 囲碁の名人戦スペシャル\ngame com.a A\nstart\nlayout\n .quit \nsay after\n' |
  HOME=$PWD "$@" shell >out
grep -qx ' 1 | A                | 囲碁の名人戦ス~' out && ! grep -q after out || { cat out; exit 1; }
printf 'say one\nexit\nsay two\n' >script.ksim
[ "$(printf 'quit\nsay three\n' | HOME=$PWD "$@" shell | tail -1; "$@" run script.ksim)" = "\
\`help\` lists the commands; Ctrl-D or \`quit\` ends.
one" ] || exit 1
