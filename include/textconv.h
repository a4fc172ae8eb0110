/*
 * textconv: text-encoding conversion for embedded hosts.
 *
 * Conventions shared by every function below:
 *   - UTF-16 ("Unicode") text is an array of 16-bit units in host byte order,
 *     ended by a 0 unit. Byte strings are ended by a NUL byte.
 *   - Every length counts BYTES, also for UTF-16 buffers (2 bytes per unit).
 *     Each contract says whether the terminator is counted.
 *   - Output buffers belong to the caller. Functions that take no capacity
 *     state the worst-case size the caller must provide.
 *   - Results are 1 for success and 0 for failure unless a contract says
 *     otherwise. errno is never used to report anything.
 *   - The library keeps process-wide caches (converters, the local encoding,
 *     a few flags) and is not thread-safe: call it from one thread at a time.
 *   - Scratch memory comes from the host services declared at the end of this
 *     header; the host application must define them.
 */
#ifndef TEXTCONV_H
#define TEXTCONV_H

#include <stdint.h>

#ifdef __cplusplus
extern "C" {
#endif

#if defined(TEXTCONV_BUILDING_LIBRARY)
#define TEXTCONV_API __attribute__((visibility("default")))
#else
#define TEXTCONV_API
#endif

/* ===================================================================== */
/* Charset identifiers and the registry                                  */
/* ===================================================================== */

/* A registered charset. Functions taking a CharsetId do not range-check it:
 * pass 0 .. CHARSET_COUNT - 1. */
typedef int32_t CharsetId;

enum {
    CHARSET_NONE = 0,
    CHARSET_LATIN1 = 1,
    CHARSET_EUCJP = 2,
    CHARSET_SJIS = 3,
    CHARSET_UTF8 = 4,
    CHARSET_UTF16 = 5,
    CHARSET_UTF16LE = 6,
    CHARSET_UTF16BE = 7,
    CHARSET_KOI8R = 8,
    CHARSET_GB18030 = 9,
    CHARSET_GB2312 = 10,
    CHARSET_GBK = 11,
    CHARSET_BIG5 = 12,
    CHARSET_BIG5HKSCS = 13,
    CHARSET_ISO8859_11 = 14,
    CHARSET_ISO8859_6 = 15,
    CHARSET_ISO8859_8 = 16,
    CHARSET_ISO8859_2 = 17,
    CHARSET_ISO8859_15 = 18,
    CHARSET_EUCKR = 19,
    CHARSET_CP1250 = 20,
    CHARSET_CP1251 = 21,
    CHARSET_CP1256 = 22,
    CHARSET_COUNT = 23
};

/* One row of charsetConversion: published for the host, never read by the
 * library itself. iconvName is the name handed to iconv_open (null for
 * CHARSET_NONE). */
typedef struct CharsetConversionEntry {
    uint32_t availability;
    const char *iconvName;
} CharsetConversionEntry;

/* Sentinel values of a cached converter cell. */
#define CONVERTER_UNOPENED (-2) /* not opened yet */
#define CONVERTER_FAILED (-1)   /* opening failed, or no conversion exists */

/* The registry, indexed by CharsetId (CHARSET_COUNT rows). */
TEXTCONV_API extern const CharsetConversionEntry charsetConversion[CHARSET_COUNT];
/* Build stamp string. */
TEXTCONV_API extern const char *const version_info;
/* Published constant, 2. */
TEXTCONV_API extern const uint32_t conversions_availability;

/* ===================================================================== */
/* UTF-8 and UTF-16 core                                                 */
/* ===================================================================== */

/* Results of the two counted-buffer workhorses. */
#define TEXTCONV_UTF_DONE 0              /* all input converted */
#define TEXTCONV_UTF_SOURCE_INCOMPLETE 1 /* a sequence runs past the input */
#define TEXTCONV_UTF_TARGET_FULL 2       /* the next output does not fit */

/* Decodes sourceLength bytes of UTF-8 into UTF-16 units. targetCapacity is in
 * bytes. Ill-formed sequences (a trailing byte not of the form 10xxxxxx, an
 * overlong form, a surrogate, a stray trailing byte) give one U+FFFD and
 * decoding resumes right after the lead byte, so every ASCII byte of the
 * input comes out as itself. A 4- to 6-byte sequence of a value above
 * U+10FFFF gives one U+FFFD and is consumed whole. Returns TEXTCONV_UTF_SOURCE_INCOMPLETE when
 * the input ends inside a sequence whose bytes so far are well formed. No
 * terminator is added (a NUL is converted only if counted in sourceLength).
 * *written (bytes) is stored only on TEXTCONV_UTF_DONE; on TARGET_FULL the
 * units already produced stay in the target. */
TEXTCONV_API uint32_t ConvertUTF8toUTF16(const char *source, uint32_t sourceLength, uint16_t *target,
                                         uint32_t targetCapacity, uint32_t *written);

/* Encodes sourceLength bytes (an even count) of UTF-16 into UTF-8. Pairs
 * become 4-byte sequences; lone surrogates are encoded as their own 3-byte
 * form. Returns TEXTCONV_UTF_DONE or TEXTCONV_UTF_TARGET_FULL; *written
 * (bytes) is stored only on DONE. No terminator is added. */
TEXTCONV_API uint32_t ConvertUTF16toUTF8(const uint16_t *source, uint32_t sourceLength, char *target,
                                         uint32_t targetCapacity, uint32_t *written);

/* NUL-terminated UTF-8 to 0-terminated UTF-16. *length in: capacity in bytes;
 * out: bytes written including the 2-byte terminator, or 0 on failure (output
 * too large, or a sequence cut short by the terminator). */
TEXTCONV_API int StringFromUTF8ToUnicode(const char *source, uint16_t *target, uint32_t *length);

/* 0-terminated UTF-16 to NUL-terminated UTF-8. *length in: capacity in bytes;
 * out: bytes written including the NUL, or 0 when the output does not fit. */
TEXTCONV_API int StringFromUnicodeToUTF8(const uint16_t *source, char *target, uint32_t *length);

/* One UTF-8 character at *cursor to one or two units in target (room for 2
 * units). *cursor always advances past the sequence, and never past a NUL
 * inside it (a NUL at *cursor is a character of its own: unit 0, advance 1).
 * *written receives 2 or 4 (bytes) on success only. Returns 1 or 0.
 * A sequence cut short by a NUL fails with *cursor on the NUL; a lead byte
 * followed by a byte that is not a trailing byte gives one U+FFFD and moves
 * *cursor past the lead byte only. An overlong or surrogate sequence of 3 or
 * more bytes fails (its U+FFFD units do not fit in 2), *cursor past it. */
TEXTCONV_API int FromUTF8ToUnicode(const char **cursor, uint16_t *target, uint32_t *written);

/* The low 16 bits of unit, encoded at *cursor (1 to 3 bytes, no terminator);
 * *cursor advances past them. Always returns 1. */
TEXTCONV_API int FromUnicodeToUTF8(uint32_t unit, char **cursor);

/* A list of NUL-terminated UTF-8 strings stored back to back (*length bytes,
 * terminators included) to a NEW list of 0-terminated UTF-16 strings. On
 * success *list points to the new block (from HostMalloc, the caller releases
 * it with HostFree; read it as uint16_t units) and *length is its byte length.
 * The input list is not changed or released. A last string without its NUL
 * gets its 0 unit all the same. On failure (a sequence cut short by a
 * terminator or by the end of the list, HostMalloc returning null) returns 0
 * and leaves *list and *length unchanged. */
TEXTCONV_API int StringListFromUTF8toUTF16(char **list, uint32_t *length);

/* ===================================================================== */
/* Direct encoders to UTF-8                                              */
/* ===================================================================== */

/* One code point (up to 31 bits) to 1..6 UTF-8 bytes at target (room for 6),
 * no terminator; *count receives the number. Returns 0, writing nothing, when
 * value >= 0x80000000. */
TEXTCONV_API int FromUCS4toUTF8(uint32_t value, char *target, uint8_t *count);

/* The KOI8-R byte at *source to 1..3 UTF-8 bytes (room for 3); *count
 * receives the number. Always returns 1. */
TEXTCONV_API int FromKOI8RtoUTF8(const char *source, char *target, uint8_t *count);

/* NUL-terminated ISO-8859-1 to UTF-8. target needs 2 * strlen(source) + 1
 * bytes; *length (out only) receives the bytes written including the NUL.
 * Always returns 1. */
TEXTCONV_API int StringFromLatin1ToUTF8(const char *source, char *target, uint32_t *length);

/* ===================================================================== */
/* Local encoding detection                                              */
/* ===================================================================== */

/* A row of a name table; a row with a null name ends the table and carries
 * the id a lookup yields when no row matches. */
typedef struct StringIDEntry {
    const char *name;
    int32_t id;
} StringIDEntry;

/* Charset names as they follow a locale name's last "." or as the platform
 * reports its codeset. */
TEXTCONV_API extern const StringIDEntry charsets[];
/* Whole locale names. */
TEXTCONV_API extern const StringIDEntry locales[];
/* Language codes; the terminating row's id is the default local encoding. */
TEXTCONV_API extern const StringIDEntry languages[];

/* The local CharsetId, decided once per process from the process locale,
 * LANG and the tables above, then cached. May call setlocale(LC_ALL, "") and
 * may write LANG and LC_ALL (fallback "en_US.ISO8859-1", or the ".UTF8"
 * rewrite when switched on). Never fails. */
TEXTCONV_API CharsetId LocalEncoding(void);

/* Stores the low byte of rewrite as the ".UTF8" rewrite switch, then does
 * what LocalEncoding does and returns its result. The switch only matters
 * before the first detection. */
TEXTCONV_API CharsetId SetCurrentLocale(uint32_t rewrite);

/* The CharsetId that the tables give for a locale name: its charset part,
 * then the whole name, then its language (whose default is CHARSET_LATIN1).
 * A null name, or no memory to copy the language, gives that default. */
TEXTCONV_API CharsetId find_charset_from(const char *name);

/* A pointer into name just past its last ".", or null when it has none (or
 * name is null). */
TEXTCONV_API const char *get_charset_from_locale(const char *name);

/* A new copy of name (release with free), cut at its first "_"; null when
 * memory is exhausted or name is null. */
TEXTCONV_API char *get_language_from_locale(const char *name);

/* Sets LANG and LC_ALL to name, then calls setlocale(LC_ALL, ""). Does
 * nothing when name is null. */
TEXTCONV_API void apply_locale_name(const char *name);

/* ===================================================================== */
/* Charset engine: strings, single characters, server code pages         */
/* ===================================================================== */

/* 0-terminated UTF-16 at *source to charset at *destination, terminator
 * converted along. Units the charset cannot hold become "?", one per unit
 * (a 16-bit "?" for the UTF-16 ids).
 * *length in: room in bytes; out on success: bytes written including the
 * terminator, and both pointers advanced past what was read and written.
 * Returns 0 when no converter exists (a message on stderr, nothing changed)
 * or when the output does not fit: nothing is ever written past the room,
 * *length then holds the bytes written by the last pass and the pointers
 * that pass's start (passes restart after each "?"). */
TEXTCONV_API int StringFromUnicodeToCharset(CharsetId charset, const uint16_t **source, char **destination,
                                            uint32_t *length);

/* NUL-terminated text in charset (0-terminated 16-bit units for the UTF-16
 * ids) at *source to 0-terminated UTF-16 at *destination. Each undecodable
 * byte (unit, for the UTF-16 ids) becomes U+FFFD; the converter's byte-order
 * mark is removed (a UTF-8 source's own leading marks are kept). *length in:
 * room in bytes, 2 x (characters + 1) suffices; out on success: bytes written
 * including the terminator. Once a converter's mark has twice taken the
 * terminator's room, the process stores every terminator itself and leaves
 * both pointers on the terminators rather than past them. On failure returns
 * 0 and writes nothing past the room; when converting had begun, *length
 * holds the bytes written by the last pass and the pointers that pass's
 * start. */
TEXTCONV_API int StringFromCharsetToUnicode(CharsetId charset, const char **source, uint16_t **destination,
                                            uint32_t *length);

/* One unit (low 16 bits of unit) to 0..4 bytes of charset at *destination,
 * which advances past them. Returns 0, writing nothing, when the charset has
 * no such character or no converter exists. */
TEXTCONV_API int FromUnicodeToCharset(CharsetId charset, uint32_t unit, char **destination);

/* One character (up to 4 bytes) of charset at *source to one unit (the high
 * surrogate of a character beyond U+FFFF). Returns 1 with *length = 2 and
 * *source advanced past the character, or past one byte (one unit for the
 * UTF-16 ids) with U+FFFD for an undecodable one; 0 when no converter exists
 * or the character is incomplete or longer than 4 bytes. */
TEXTCONV_API int FromCharsetToUnicode(CharsetId charset, const char **source, uint16_t *destination,
                                      uint32_t *length);

/* One unit to one KOI8-R byte at *destination (advanced by 1). Returns 0,
 * silently, when KOI8-R has no such character or no converter exists. */
TEXTCONV_API int FromUnicodeToKOI8R(uint32_t unit, char **destination);

/* The KOI8-R byte at *source (advanced by 1) to one unit. Returns 0 when no
 * converter exists. */
TEXTCONV_API int FromKOI8RToUnicode(const char **source, uint16_t *destination);

/* NUL-terminated text in Windows code page codePage to charset. Known code
 * pages: 874 932 936 949 950 1250 1251 1252 (read as ISO-8859-1) 1255 1256.
 * *length in: room in bytes (at least 1); out: bytes of the result including
 * its terminator. Text that cannot be converted (unknown code page, no
 * converter, no memory, a result larger than the room) is copied unchanged,
 * cut to the room and terminated, the rest of the room filled with NULs; a
 * room of 0 gets nothing. Always returns 1. */
TEXTCONV_API int StringFromServerCPToCharset(CharsetId charset, int32_t codePage, const char *source,
                                             char *destination, uint32_t *length);

/* StringFromServerCPToCharset into the local encoding. Always returns 1. */
TEXTCONV_API int StringFromServerCPToLocal(int32_t codePage, const char *source, char *destination,
                                           uint32_t *length);

/* ===================================================================== */
/* Japanese: JIS row/cell codes, Shift-JIS, EUC-JP                       */
/* ===================================================================== */

/* The JIS pivot form: row and cell (1..94) of a double-byte character, or in
 * byte[0] a single byte (ASCII or half-width katakana 0xA1..0xDF). */
typedef struct JisCode {
    uint8_t byte[2];
} JisCode;

/* Kind codes: the set or byte form of a Japanese character. */
enum {
    MB_KIND_SINGLE = 1,   /* a single byte: half-width katakana or space */
    MB_KIND_JISX0208 = 2, /* JIS X 0208 row/cell */
    MB_KIND_JISX0212 = 3, /* JIS X 0212 row/cell */
    MB_KIND_ANY = 4,      /* request only: accept kinds 1, 2, 3 and 6 */
    MB_KIND_SJIS = 5,     /* Shift-JIS bytes */
    MB_KIND_ASCII = 6     /* reported only: printable ASCII 0x21..0x7E */
};

/* Forms in which ConvertFromJISToUnicode receives a character. */
enum {
    JIS_FORM_ASCII = 0,    /* given[0] = 1..94, the byte given[0] + 0x20 */
    JIS_FORM_X0208 = 1,    /* given[0] = row, given[1] = cell */
    JIS_FORM_KATAKANA = 2, /* given[0] = 1..63, the byte given[0] + 0xA0 */
    JIS_FORM_X0212 = 3     /* given[0] = row, given[1] = cell */
};

/* One Shift-JIS character to its JIS code. Writes *kind (MB_KIND_SINGLE or
 * MB_KIND_JISX0208), *jis and *consumed (1 or 2) and returns 1; returns 0,
 * writing nothing, for an invalid byte (controls, 0x80, 0xA0, 0xF0..0xFF) or
 * a lead byte whose trail byte is outside 0x40..0x7E, 0x80..0xFC. */
TEXTCONV_API int FromSJisToJis(const char *sjis, uint8_t *kind, JisCode *jis, uint8_t *consumed);

/* One JIS code of kind MB_KIND_SINGLE or MB_KIND_JISX0208 to 1 or 2 Shift-JIS
 * bytes (*length receives the count). Returns 0, writing nothing, for any
 * other kind or an out-of-range code. */
TEXTCONV_API int FromJisToSJis(uint32_t kind, const JisCode *jis, char *sjis, uint8_t *length);

/* NUL-terminated Shift-JIS to EUC-JP. *length in: capacity in bytes, the
 * terminator INCLUDED; out: bytes written including it (a capacity of 0
 * writes nothing and leaves 0). Stops early, at a character boundary, when
 * room runs out (not an error). Returns 1, or 0 when an invalid byte was
 * replaced by a space. */
TEXTCONV_API int StringFromSJISToEUCJP(const char *sjis, char *euc, uint32_t *length);

/* When the local encoding is EUC-JP: *result receives a new EUC-JP copy of
 * sjis from Mem_alloc (release with Mem_free(1, block)) and 1 is returned.
 * Otherwise (another local encoding, no memory, an invalid byte) *result
 * receives sjis itself and 0 is returned. */
TEXTCONV_API int StringToCurrentEncoding(const char *sjis, char **result);

/* Row 13 (NEC special characters) of JIS X 0208: the unit of cells 1..94,
 * 0xFFFF where a cell is empty. */
TEXTCONV_API extern const uint16_t MS_Sun_extension_table[94];

/* One character given in a JIS_FORM_* layout to one unit. *unit is always
 * written: the character on success, 0xFFFF on failure. */
TEXTCONV_API int ConvertFromJISToUnicode(const uint8_t *given, uint16_t *unit, uint32_t form);

/* One character of kind 1, 2, 3 (a JisCode) or 5 (Shift-JIS bytes) to one
 * unit. Other kinds return 0 and leave *unit unchanged. */
TEXTCONV_API int FromMultiByteToUnicode(uint32_t kind, const uint8_t *code, uint16_t *unit);

/* One EUC-JP character at *cursor to one unit; *cursor advances past it (1, 2
 * or 3 bytes) on success and stays on failure. Never reads past a NUL. */
TEXTCONV_API int FromEUCJPToUnicode(const char **cursor, uint16_t *unit);

/* One unit to 1..3 EUC-JP bytes at euc (room for 3); no count is returned:
 * 0x8F leads 3 bytes, 0x8E and 0xA1..0xFE lead 2, anything else is 1. */
TEXTCONV_API int ConvertFromUnicodeToEUCJP(uint16_t unit, char *euc);

/* One unit to a JisCode (request 1..4) or Shift-JIS bytes (request 5) in
 * code (room for 2); *kind (may be null) receives the kind, *length 1 or 2.
 * Returns 0, writing nothing, when the result's kind is not accepted. */
TEXTCONV_API int FromUnicodeToMultiByte(uint16_t unit, uint32_t request, uint8_t *kind, uint8_t *code,
                                        uint8_t *length);

/* One unit to 1..3 EUC-JP bytes at *cursor (room for 3), which advances past
 * them. Returns 0, writing nothing, when EUC-JP has no such character. */
TEXTCONV_API int FromUnicodeToEUCJP(uint16_t unit, char **cursor);

/* One EUC-JP character to 1..3 UTF-8 bytes (room for 3); *count receives the
 * number. Returns the EUC-JP bytes taken (1..3), or 0, writing nothing, when
 * no character can start there: a byte that leads nothing, or a lead byte
 * whose following bytes are cut short by the NUL or by an ASCII byte. An
 * unmappable character becomes U+FFFF. */
TEXTCONV_API uint32_t FromEUCJPtoUTF8(const char *euc, char *utf8, uint8_t *count);

/* NUL-terminated EUC-JP to UTF-8. utf8 needs 3 * strlen / 2 + 1 bytes.
 * *length (out only): bytes written including the NUL. Returns 0 at the first
 * byte that cannot start a character (partial output, no NUL, *length
 * untouched). */
TEXTCONV_API int StringFromEUCJPToUTF8(const char *euc, char *utf8, uint32_t *length);

/* NUL-terminated Shift-JIS to UTF-8. utf8 needs 3 * strlen + 1 bytes.
 * *length (out only): bytes written including the NUL. Returns 0 at the first
 * invalid byte (partial output, no NUL, *length = 1 + bytes written). */
TEXTCONV_API int StringFromSJISToUTF8(const char *sjis, char *utf8, uint32_t *length);

/* NUL-terminated EUC-JP to Shift-JIS. *length in: bytes that may be written
 * BEFORE the terminator (the buffer holds one more; a negative value writes
 * nothing and leaves 0); out: bytes written including the terminator.
 * Returns 1, or 0 when a character was replaced by a space; a bad sequence
 * becomes one space and never takes an ASCII byte with it. */
TEXTCONV_API int StringFromEUCJPToSJIS(const char *euc, char *sjis, int32_t *length);

/* ===================================================================== */
/* Local-encoding layer                                                  */
/* ===================================================================== */

/* StringFromUnicodeToCharset with the local CharsetId; the caller's pointers
 * do not move. */
TEXTCONV_API int StringFromUnicodeToLocal(const uint16_t *source, char *target, uint32_t *length);

/* StringFromCharsetToUnicode with the local CharsetId; the caller's pointers
 * do not move. */
TEXTCONV_API int StringFromLocalToUnicode(const char *source, uint16_t *target, uint32_t *length);

/* FromUnicodeToCharset with the local CharsetId. */
TEXTCONV_API int FromUnicodeToLocal(uint32_t unit, char **cursor);

/* FromCharsetToUnicode with the local CharsetId. */
TEXTCONV_API int FromLocalToUnicode(const char **cursor, uint16_t *target, uint32_t *count);

/* NUL-terminated UTF-8 to the local encoding. No capacity is taken: target
 * must hold the converted text and its NUL: strlen(source) + 1 bytes when
 * the local encoding is UTF-8 (the bytes are copied as they stand), else at
 * most 4 bytes per UTF-16 unit of the decoded text, plus 1.
 * *length (out only): bytes written including the NUL. Returns 1; 0 when a
 * unit became "?" (output complete) or when the UTF-8 ends in a cut-short
 * sequence or is longer than (2^32 - 2) / 4 bytes (nothing written, *length
 * untouched). Nothing is allocated. */
TEXTCONV_API int StringFromUTF8ToLocal(const char *source, char *target, uint32_t *length);

/* NUL-terminated local text to UTF-8. *length in: capacity, read only when the
 * local encoding is converted through UTF-16 (the Latin-1, EUC-JP, UTF-8 and
 * KOI8-R paths need 2, 3/2, 1 and 3 bytes per source byte plus 1); out: bytes
 * written including the NUL, 0 when the output did not fit (empty string
 * written; nothing at all with a capacity of 0). On that path no memory or no
 * converter also gives the empty string, with *length 1. Returns 1, or 0 on
 * the EUC-JP path for a bad sequence (partial output, no NUL, *length kept). */
TEXTCONV_API int StringFromLocalToUTF8(const char *source, char *target, uint32_t *length);

/* Replaces a list of 0-terminated UTF-16 strings (*length bytes; the block
 * must come from HostMalloc) with a NEW block from HostMalloc holding the
 * strings in the local encoding plus one closing NUL; *length receives its
 * byte length. The old block is released. Unconvertible units become "?".
 * A last string with no 0 unit within *length ends at the list's end. When
 * memory runs out the caller's list and length are left as they were. */
TEXTCONV_API void StringListFromUnicodeToLocal(uint16_t **list, uint32_t *length);

/* Little-endian 16-bit units (*length bytes available, in) to a NUL-terminated
 * local string; stops at a 0 unit or at the first unit the local encoding
 * cannot hold. *length out: bytes written including the NUL. No capacity is
 * tested. */
TEXTCONV_API void host_stringFromWindowsUnicode(const char *source, char *target, int32_t *length);

/* NUL-terminated local string to 0-terminated UTF-16; stops at the first
 * character that cannot be converted. *length (out only): bytes written
 * including the terminator. No capacity is tested. */
TEXTCONV_API void host_stringToWindowsUnicode(const char *source, uint16_t *target, uint32_t *length);

/* 1 when the two NUL-terminated strings hold the same text. An encoding of
 * CHARSET_UTF8 reads the string as UTF-8; any other value reads it in the
 * local encoding. A nonzero ignoreCase folds units up to 0xFF through the
 * current locale's upper-case table. 0 when they differ or a decoder fails. */
TEXTCONV_API int StringsEquivalent(const char *first, int32_t firstEncoding, const char *second,
                                   int32_t secondEncoding, uint8_t ignoreCase);

/* ===================================================================== */
/* Direction escaping                                                    */
/* ===================================================================== */

/* Direction classes of a UTF-16 unit. */
enum { DIRECTION_LTR = 0, DIRECTION_RTL = 1, DIRECTION_NEUTRAL = 2 };

/* The NUL-terminated source in charset to the same text in charset with
 * "%l" before each left-to-right run, "%r" before each right-to-left run and
 * "%" doubled. *length in: L, the target's room in bytes, which also bounds
 * the work (about L/2 characters are taken); out: bytes written including the
 * terminator. When a conversion fails (among others, the source in UTF-16
 * needing more than 2 L bytes or the escaped text more than L bytes), or a
 * large L finds no scratch memory at the host, the source is copied with
 * strncpy(target, source, L) and *length keeps its value. Always returns 1. */
TEXTCONV_API int StringFromCharsetToDirectionEscapedString(CharsetId charset, char *target, const char *source,
                                                           uint32_t *length);

/* The same in the local encoding. Always returns 1. */
TEXTCONV_API int StringFromLocalToDirectionEscapedString(char *target, const char *source, uint32_t *length);

/* ===================================================================== */
/* Host services: defined by the host application, resolved at load time */
/* ===================================================================== */

/* At least size writable bytes (flags is always 1), or null. */
void *HostMalloc(uint32_t size, uint32_t flags);
/* Releases a block from HostMalloc. */
void HostFree(void *block);
/* Stores a block of size bytes in *block and returns 0; nonzero on failure.
 * pool is always 1. */
int Mem_alloc(uint32_t pool, uint32_t size, void **block);
/* Releases a block from Mem_alloc. pool is always 1. */
void Mem_free(uint32_t pool, void *block);
/* Asks whether to continue without a converter from fromName to toName
 * (question is always 3, a and b 0). 0 means no: the library then calls
 * exit(1). */
int UIYesNoDisplay(uint32_t question, uint32_t a, uint32_t b, const char *fromName, const char *toName);
/* The id of the row of table whose name matches key, or the id of the
 * terminating row. */
int32_t GetiStringID(const char *key, const StringIDEntry *table);
/* memmove: copies byteCount bytes between areas that may overlap. */
void *memmove_soc(void *dest, const void *src, uint32_t byteCount);

#ifdef __cplusplus
}
#endif

#endif /* TEXTCONV_H */
