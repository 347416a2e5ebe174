#!/usr/bin/env bash
# tool_test.sh SCRATCH VERSION COMMAND...
# Runs tessaline-config (COMMAND) as a script would, one case a row: exit
# status, stdout and stderr compared exactly, then the file afterwards.
set -u
scratch=$1 version=$2
shift 2
tool=("$@")
rm -rf "$scratch" && mkdir -p "$scratch" && cd "$scratch" || exit 1
failures=0 cases=0 in=/dev/null
E='tessaline-config: '

fail() { echo "FAIL: $*"; failures=$((failures + 1)); }

# start TEXT: app.ini holds TEXT; `untouched` later proves it was not rewritten.
start() { printf '%s' "$1" >app.ini && before=$(stat -c '%i %y' app.ini) && text=$1; }
untouched() { [ "$(stat -c '%i %y' app.ini)" = "$before" ] && [ "$(cat app.ini)" = "${text%$'\n'}" ] || fail "app.ini rewritten"; }

# check STATUS STDOUT STDERR ARGS...: standard input from $in.
check() {
  local status=$1 out=$2 err=$3
  shift 3
  cases=$((cases + 1))
  "${tool[@]}" "$@" <"$in" >out.txt 2>err.txt
  local got=$?
  [ "$got" = "$status" ] && [ "$(cat out.txt; echo .)" = "$out." ] && [ "$(cat err.txt; echo .)" = "$err." ] ||
    fail "$* -> status $got, stdout $(cat -A out.txt), stderr $(cat -A err.txt)"
}

# file_is FILE TEXT: FILE holds TEXT and one closing identification line.
file_is() {
  local body
  body=$(sed '$d' "$1"; echo .)
  [ "$body" = "$2." ] && tail -n 1 "$1" | grep -q '^# Edited by Tessaline: ' || fail "$1 holds $(cat -A "$1")"
}

# Reading: names in any case, the section "", every format with its escapes.
start $'# top\na = 1\n\n[Net]\nport = 80\nmsg = it\'s "x"\\\t\xc3\xa9\xff\xe2\x82\xac\xe2\x82(\xc3(\n[9pm]\nk.v = v\n[empty]\n'
check 0 $'80\n' '' get app.ini NET Port
check 0 $'1\n' '' get app.ini '' a
check 1 '' "${E}app.ini: no key 'nope' in section 'net'"$'\n' get app.ini net nope
check 1 '' "${E}app.ini: no section 'nos'"$'\n' get app.ini nos k
check 0 $'x y\n' '' get --default 'x y' app.ini nos k
check 3 '' "${E}missing.ini: No such file or directory"$'\n' get missing.ini s k
check 3 '' "${E}.: Is a directory"$'\n' keys . s
check 0 $'9pm\n\nNet\nempty\n' '' sections app.ini
check 0 $'msg\nport\n' '' keys app.ini net
check 1 '' "${E}app.ini: no section 'nos'"$'\n' keys app.ini nos
check 0 $'a = 1\n[9pm]\nk.v = v\n[Net]\nmsg = it\'s "x"\\\t\xc3\xa9\xff\xe2\x82\xac\xe2\x82(\xc3(\nport = 80\n' '' dump app.ini
check 0 $'{\n  "": {\n    "a": "1"\n  },\n  "9pm": {\n    "k.v": "v"\n  },\n  "Net": {\n    "msg": "it\'s \\"x\\"\\\\\\u0009\xc3\xa9\\u00ff\xe2\x82\xac\\u00e2\\u0082(\\u00c3(",\n    "port": "80"\n  },\n  "empty": {}\n}\n' '' dump app.ini --format json
check 0 $'_a=\'1\'\n_9pm_k_v=\'v\'\nNet_msg=\'it\'\\\'\'s "x"\\\t\xc3\xa9\xff\xe2\x82\xac\xe2\x82(\xc3(\'\nNet_port=\'80\'\n' '' dump app.ini --format sh
check 0 $'[ 9pm ] k.v = v\n' '' dump app.ini 9PM --format lines
check 0 $'{\n  "empty": {}\n}\n' '' dump app.ini empty --format json
untouched

# Writing nothing new leaves the file as it was, not even rewritten.
start $'# top\n[net]\nport = 80\nhosts = a, b\n'
check 0 '' "${E}app.ini: unchanged"$'\n' set app.ini NET PORT 80 --verbose
check 0 '' '' set app.ini net hosts 'b ,a' --list
check 0 '' '' del app.ini net nope
check 0 '' '' del app.ini net hosts c --list
check 0 '' '' del app.ini nos
check 1 '' "${E}app.ini: no key 'nope' in section 'net'"$'\n' set app.ini net nope 1 --existing
check 1 '' "${E}app.ini: no section 'nos'"$'\n' del app.ini nos --existing
check 2 '' "${E}key 'a=b' cannot be stored: the file would read it back differently"$'\n' set app.ini s a=b 1
check 2 '' "${E}section ' s' cannot be stored: the file would read it back differently"$'\n' set app.ini ' s' k 1
printf 'a\0b\n' >in.txt && in=in.txt
check 2 '' "${E}the value holds a line break or NUL, which the file cannot carry"$'\n' set app.ini s k -
in=/dev/null
check 0 '' '' merge app.ini app.ini
untouched

# Changes: in place, quoted where the reader would change the value, backup.
check 0 '' "${E}app.ini: changed"$'\n' set --verbose app.ini net port 8080 --backup
check 0 '' '' set app.ini '' top ' padded '
check 0 '' '' set app.ini new empty ''
check 0 '' '' set app.ini net hosts 'c, a' --list
check 0 '' '' set app.ini net ports '80;81' --list --list-sep ' ; '
check 0 '' '' set app.ini net -- key --dashes
file_is app.ini $'# top\ntop = " padded "\n[net]\nport = 8080\nhosts = a, b, c\nports = 80 ; 81\nkey = --dashes\n[new]\nempty = ""\n'
check 0 $' padded \n' '' get app.ini '' top
check 0 $'\n' '' get app.ini new empty
check 0 '' '' del app.ini net hosts a --list
check 0 '' '' del app.ini net port
check 0 '' '' del app.ini new
file_is app.ini $'# top\ntop = " padded "\n[net]\nhosts = b, c\nports = 80 ; 81\nkey = --dashes\n'
[ "$(cat app.bak)" = "${text%$'\n'}" ] || fail "app.bak holds $(cat -A app.bak)"
check 0 '' '' del gone.ini s k
[ ! -e gone.ini ] || fail "del created gone.ini"
check 3 '' "${E}nodir/app.ini: No such file or directory"$'\n' set nodir/app.ini s k v
mkdir real && printf '[s]\nk = 1\n' >real/app.ini && ln -s real/app.ini link.ini
check 0 '' '' set link.ini s k 2
[ -L link.ini ] && file_is real/app.ini $'[s]\nk = 2\n' || fail "link.ini no longer a link to real/app.ini"
long=$(printf '%4089s' | tr ' ' x)
check 0 '' '' set long.ini s k "$long"
check 0 "$long"$'\n' '' get long.ini s k
check 2 '' "${E}the line of key 'k' would be longer than the file's 4094-byte limit"$'\n' set long.ini s k "x$long"

# Secrets: the host's encrypted form, read from stdin, decrypted by get.
secret=D9993EDEF413D2A604959413DB5571011372ECF3F7F1A671A98E6865722BD40CDEAB
printf 'correct horse battery staple\r\nnext line\n' >in.txt && in=in.txt
check 0 '' '' set new.ini db pw - --encrypt
in=/dev/null
file_is new.ini "[db]"$'\n'"pw = $secret"$'\n'
check 0 $'correct horse battery staple\n' '' get new.ini db pw --decrypt
check 0 "$secret"$'\n' '' get new.ini db pw
check 0 $'clear\n' '' get new.ini db user --decrypt --default clear
check 0 "$secret"$'\n' '' encrypt 'correct horse battery staple'
echo "$secret" >in.txt && in=in.txt
check 0 $'correct horse battery staple\n' '' decrypt -
in=/dev/null
check 0 $'hi\n' '' decrypt "000000680169$(printf '%068d' 0)"
check 1 '' "${E}not an encrypted value"$'\n' decrypt cafe

# Merge: every key, or with --existing only those FILE has; OTHER from stdin.
printf 'x = 1\n[db]\npw = clear\nhost = h\n' >other.ini
check 0 '' '' merge new.ini other.ini --existing
file_is new.ini $'[db]\npw = clear\n'
in=other.ini
check 0 '' '' merge merged.ini -
in=/dev/null
file_is merged.ini $'x = 1\n[db]\nhost = h\npw = clear\n'

# Usage errors.
check 2 '' "${E}no command (try --help)"$'\n'
check 2 '' "${E}unknown command 'put' (try --help)"$'\n' put app.ini
check 2 '' "${E}unknown option '--force' (try --help)"$'\n' set app.ini s k v --force
check 2 '' "${E}get does not take --encrypt (try --help)"$'\n' get app.ini s k --encrypt
check 2 '' "${E}--default needs a value (try --help)"$'\n' get app.ini s k --default
check 2 '' "${E}missing arguments: tessaline-config get FILE SECTION KEY (try --help)"$'\n' get app.ini s
check 2 '' "${E}del takes ITEM together with --list (try --help)"$'\n' del app.ini s k item
check 2 '' "${E}--list-sep needs --list (try --help)"$'\n' set app.ini s k v --list-sep ';'
check 2 '' "${E}unknown format 'xml' (try --help)"$'\n' dump app.ini --format xml
check 0 "tessaline-config $version"$'\n' '' --version

echo "$cases cases, $failures failures"
[ "$failures" = 0 ]
