#!/bin/sh
# SPDX-License-Identifier: MIT
# Formats all sources; with --check, names what is not formatted and fails.
set -eu
cd "$(dirname "$0")/.."
case "${1:-}" in
--check) mode="--dry-run --Werror" ;;
*) mode=-i ;;
esac
# shellcheck disable=SC2086
git ls-files -z --cached --others --exclude-standard -- '*.h' '*.hpp' '*.c' '*.cpp' | xargs -0 clang-format $mode
