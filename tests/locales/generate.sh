#!/bin/sh
# Builds real glibc locales into one folder for the tests, which reach them
# through LOCPATH. Usage: generate.sh <output folder>
#
# Each locale sits in a folder named as glibc looks it up: the codeset
# normalised (lower case, letters and digits only), so "en_US.ISO8859-1",
# "en_US.ISO-8859-1" and "en_US.iso88591" all find "en_US.iso88591"; a name
# without a codeset (as in glibc's list of supported locales) is a folder of
# its own. Locales already built are kept, so later runs take no time.
set -u

out=${1:?usage: generate.sh <output folder>}
command -v localedef >/dev/null 2>&1 || {
    echo "generate.sh: localedef not found (install the C library's locale tools)" >&2
    exit 1
}
mkdir -p "$out" || exit 1

# folder, locale source, charmap
list='
en_US.iso88591   en_US ISO-8859-1
en_US            en_US ISO-8859-1
en_US.iso885915  en_US ISO-8859-15
en_US.utf8       en_US UTF-8
de_DE.iso88591   de_DE ISO-8859-1
de_DE            de_DE ISO-8859-1
de_DE.utf8       de_DE UTF-8
fr_FR            fr_FR ISO-8859-1
ja_JP.eucjp      ja_JP EUC-JP
ja_JP.sjis       ja_JP SHIFT_JIS
ja_JP.utf8       ja_JP UTF-8
ru_RU            ru_RU ISO-8859-5
ru_RU.koi8r      ru_RU KOI8-R
ru_RU.cp1251     ru_RU CP1251
ru_RU.utf8       ru_RU UTF-8
he_IL            he_IL ISO-8859-8
he_IL.iso88598   he_IL ISO-8859-8
he_IL.utf8       he_IL UTF-8
zh_CN            zh_CN GB2312
zh_CN.gbk        zh_CN GBK
zh_CN.gb18030    zh_CN GB18030
zh_CN.utf8       zh_CN UTF-8
zh_TW            zh_TW BIG5
zh_TW.euctw      zh_TW EUC-TW
zh_HK            zh_HK BIG5-HKSCS
ko_KR.euckr      ko_KR EUC-KR
th_TH            th_TH TIS-620
ar_EG            ar_EG ISO-8859-6
ar_EG.iso88596   ar_EG ISO-8859-6
ar_EG.utf8       ar_EG UTF-8
ar_IN            ar_IN UTF-8
pl_PL            pl_PL ISO-8859-2
tr_TR            tr_TR ISO-8859-9
'

status=0
built=0
echo "$list" | while read -r folder source charmap; do
    [ -n "$folder" ] || continue
    [ -f "$out/$folder/LC_CTYPE" ] && continue
    # Build beside the target and move into place, so an interrupted run
    # never leaves a half-written locale that a later run would keep.
    tmp="$out/.tmp.$folder.$$"
    rm -rf "$tmp"
    # Shift-JIS and a few others are not ASCII compatible: localedef warns
    # and exits non-zero although the locale is usable; judge by the output.
    localedef --no-archive --no-warnings=ascii -c -i "$source" -f "$charmap" "$tmp" >"$tmp.log" 2>&1
    if [ -f "$tmp/LC_CTYPE" ] && [ -f "$tmp/LC_COLLATE" ]; then
        rm -rf "$out/$folder"
        mv "$tmp" "$out/$folder" && rm -f "$tmp.log"
        echo "built $folder ($source, $charmap)"
    else
        echo "generate.sh: could not build $folder ($source, $charmap):" >&2
        cat "$tmp.log" >&2
        rm -rf "$tmp" "$tmp.log"
        exit 1
    fi
done || status=1
exit $status
