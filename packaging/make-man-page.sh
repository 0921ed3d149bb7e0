#!/bin/sh
# SPDX-License-Identifier: MIT
# Makes a man page from the command's own help.
#
#   make-man-page.sh HELP2MAN NETFLOOR PAGE DESCRIPTION [COMMAND]
set -eu
help2man=$1
program=$2
page=$3
description=$4
command=${5:-}
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT

# help2man runs one program, which has no name of a command after it.
cat >"$work/netfloor" <<END
#!/bin/sh
case \$1 in
--version) exec "$program" --version ;;
*) exec "$program" $command --help ;;
esac
END
chmod +x "$work/netfloor"
# The date of the page is that of nothing: a page of the same sources is the same page.
SOURCE_DATE_EPOCH=${SOURCE_DATE_EPOCH:-0} "$help2man" --no-info --name "$description" --output "$page" "$work/netfloor"
