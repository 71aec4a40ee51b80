#!/bin/sh
# shellcheck disable=SC2016 # git expands what is in single quotes
# Makes git show how a changed array in this repository differs.
echo '*.npy diff=npy' >>.gitattributes

# git diff, git show, git log --patch: what a report says about each array alone, line by line, and
# a checksum that differs whenever the array does.
git config diff.npy.textconv 'f() { talcmp --report "$1" "$1" | tail -n +2; cksum <"$1"; }; f'

# git difftool: how the old array and the new one differ.
git config difftool.talcmp.cmd 'talcmp --report "$LOCAL" "$REMOTE" || true'
git config diff.tool talcmp
git config difftool.prompt false
