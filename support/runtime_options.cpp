// The runtime option table and its checked accessors.
#include "support/runtime_options.h"

#include <cstring>
#include <list>
#include <string>

#include "support/diagnostic.h"

namespace {

constexpr std::uint16_t kSet = 1;
constexpr std::uint16_t kBootstrap = 2;
constexpr std::uint16_t type(int t) { return static_cast<std::uint16_t>(t << 2); }
int typeOf(const RuntimeOption& o) { return (o.flags >> 2) & 0xff; }

// Names beyond the viewer's four belong to the instrumentation side; the viewer only
// needs them so that such options on its command line are accepted.
const RuntimeOption kInitial[kRuntimeOptionCount] = {
    /*   0 */ {0, 0, type(0), "DUMMY_OPTION"},
    /*   1 */ {0, 0, type(0), "VERBOSE"},
    /*   2 */ {0, 0, type(0), "QUIET"},
    /*   3 */ {0, 0, type(1), "DEBUG_LEVEL"},
    /*   4 */ {0, 0, type(2), "WARNING_LIMIT"},
    /*   5 */ {0, 0, type(2), "ERROR_LIMIT"},
    /*   6 */ {0, 0, type(4), "OUTPUT_DIR"},
    /*   7 */ {0, 0, type(4), "KGV_FILE"},
    /*   8 */ {0, 0, kBootstrap | type(0), "KESTREL"},
    /*   9 */ {0, 0, type(4), "KGV_DIR"},
    /*  10 */ {0, 0, type(0), "APPEND_DATA"},
    /*  11 */ {0, 0, type(0), "HIT_FLAGS_ONLY"},
    /*  12 */ {0, 0, type(0), "SAVE_ON_EXIT"},
    /*  13 */ {0, 0, type(1), "SAVE_INTERVAL"},
    /*  14 */ {0, 0, type(1), "SAVE_ON_SIGNAL"},
    /*  15 */ {0, 0, type(1), "LOCK_TIMEOUT"},
    /*  16 */ {0, 0, type(1), "LOCK_AGE"},
    /*  17 */ {0, 0, type(4), "TEMP_DIR"},
    /*  18 */ {0, 0, type(4), "CACHE_DIR"},
    /*  19 */ {0, 0, type(2), "CACHE_SIZE"},
    /*  20 */ {0, 0, type(1), "THREADS"},
    /*  21 */ {0, 0, type(1), "FORK_HANDLING"},
    /*  22 */ {0, 0, type(1), "EXEC_HANDLING"},
    /*  23 */ {0, 0, type(1), "SIGNAL_HANDLING"},
    /*  24 */ {0, 0, type(1), "INSTRUMENT_JAVA"},
    /*  25 */ {0, 0, type(4), "JAVA_HOME"},
    /*  26 */ {0, 0, type(1), "JAVA_CLASSPATH"},
    /*  27 */ {0, 0, type(1), "DEMANGLER"},
    /*  28 */ {0, 0, type(1), "SYMBOL_CACHE"},
    /*  29 */ {0, 0, type(1), "PRINT_STATS"},
    /*  30 */ {0, 0, type(1), "LINKER"},
    /*  31 */ {0, 0, type(1), "COMPILER"},
    /*  32 */ {0, 0, type(1), "SOURCE_ROOT"},
    /*  33 */ {0, 0, type(1), "OBJECT_ROOT"},
    /*  34 */ {0, 0, type(1), "EXCLUDE_FILES"},
    /*  35 */ {0, 0, type(1), "INCLUDE_FILES"},
    /*  36 */ {0, 0, type(1), "EXCLUDE_FUNCTIONS"},
    /*  37 */ {0, 0, type(1), "INCLUDE_FUNCTIONS"},
    /*  38 */ {0, 0, type(1), "COUNT_CALLS"},
    /*  39 */ {0, 0, type(1), "COUNT_BLOCKS"},
    /*  40 */ {0, 0, type(1), "COUNT_EDGES"},
    /*  41 */ {0, 0, type(1), "MAX_SESSIONS"},
    /*  42 */ {0, 0, type(4), "SESSION_NAME"},
    /*  43 */ {0, 0, type(4), "RUN_NAME"},
    /*  44 */ {0, 0, type(4), "TEST_NAME"},
    /*  45 */ {0, 0, type(4), "TIMESTAMP_FORMAT"},
    /*  46 */ {0, 0, type(1), "CLOCK_TIME"},
    /*  47 */ {0, 0, type(1), "CPU_TIME"},
    /*  48 */ {0, 0, type(1), "MERGE_ON_SAVE"},
    /*  49 */ {0, 0, type(1), "FORCE_MERGE"},
    /*  50 */ {0, 0, type(1), "WHERE_AM_I"},
    /*  51 */ {0, 0, type(1), "LANGUAGE"},
    /*  52 */ {0, 0, type(1), "HELP_BROWSER"},
    /*  53 */ {0, 0, type(4), "HELP_DIR"},
    /*  54 */ {0, 0, type(4), "LICENSE_FILE"},
    /*  55 */ {0, 0, type(1), "LICENSE_SERVER"},
    /*  56 */ {0, 0, type(1), "SUPPORT_ADDRESS"},
    /*  57 */ {0, 0, type(1), "ARCHIVE_HANDLING"},
    /*  58 */ {0, 0, type(1), "SHARED_LIBS"},
    /*  59 */ {0, 0, type(1), "DLOPEN_HANDLING"},
    /*  60 */ {0, 0, type(1), "PRELOAD_LIB"},
    /*  61 */ {0, 0, type(2), "STACK_SIZE"},
    /*  62 */ {0, 0, type(2), "HEAP_SIZE"},
    /*  63 */ {0, 0, type(0), "BLOCK_ENABLE"},
    /*  64 */ {0, 0, type(2), "BLOCK_LIMIT"},
    /*  65 */ {0, 0, type(2), "BLOCK_SIZE"},
    /*  66 */ {0, 0, type(2), "BLOCK_COUNT"},
    /*  67 */ {0, 0, type(4), "BLOCK_DIR"},
    /*  68 */ {0, 0, type(4), "BLOCK_FILE"},
    /*  69 */ {0, 0, type(1), "BLOCK_MODE"},
    /*  70 */ {0, 0, type(0), "BLOCK_CHECK"},
    /*  71 */ {0, 0, type(1), "BLOCK_REPORT"},
    /*  72 */ {0, 0, type(1), "BLOCK_INTERVAL"},
    /*  73 */ {0, 0, type(1), "BLOCK_RETRY"},
    /*  74 */ {0, 0, type(2), "BLOCK_ALIGN"},
    /*  75 */ {0, 0, type(1), "BLOCK_FLUSH"},
    /*  76 */ {0, 0, type(4), "BLOCK_PREFIX"},
    /*  77 */ {0, 0, type(4), "BLOCK_SUFFIX"},
    /*  78 */ {0, 0, type(0), "BLOCK_WARN"},
    /*  79 */ {0, 0, type(0), "CALL_ENABLE"},
    /*  80 */ {0, 0, type(2), "CALL_LIMIT"},
    /*  81 */ {0, 0, type(2), "CALL_SIZE"},
    /*  82 */ {0, 0, type(2), "CALL_COUNT"},
    /*  83 */ {0, 0, type(4), "CALL_DIR"},
    /*  84 */ {0, 0, type(4), "CALL_FILE"},
    /*  85 */ {0, 0, type(1), "CALL_MODE"},
    /*  86 */ {0, 0, type(0), "CALL_CHECK"},
    /*  87 */ {0, 0, type(1), "CALL_REPORT"},
    /*  88 */ {0, 0, type(1), "CALL_INTERVAL"},
    /*  89 */ {0, 0, type(1), "CALL_RETRY"},
    /*  90 */ {0, 0, type(2), "CALL_ALIGN"},
    /*  91 */ {0, 0, type(1), "CALL_FLUSH"},
    /*  92 */ {0, 0, type(4), "CALL_PREFIX"},
    /*  93 */ {0, 0, type(4), "CALL_SUFFIX"},
    /*  94 */ {0, 0, type(0), "CALL_WARN"},
    /*  95 */ {0, 0, type(0), "EDGE_ENABLE"},
    /*  96 */ {0, 0, type(2), "EDGE_LIMIT"},
    /*  97 */ {0, 0, type(2), "EDGE_SIZE"},
    /*  98 */ {0, 0, type(2), "EDGE_COUNT"},
    /*  99 */ {0, 0, type(4), "EDGE_DIR"},
    /* 100 */ {0, 0, type(4), "EDGE_FILE"},
    /* 101 */ {0, 0, type(1), "EDGE_MODE"},
    /* 102 */ {0, 0, type(0), "EDGE_CHECK"},
    /* 103 */ {0, 0, type(1), "EDGE_REPORT"},
    /* 104 */ {0, 0, type(1), "EDGE_INTERVAL"},
    /* 105 */ {0, 0, type(1), "EDGE_RETRY"},
    /* 106 */ {0, 0, type(2), "EDGE_ALIGN"},
    /* 107 */ {0, 0, type(1), "EDGE_FLUSH"},
    /* 108 */ {0, 0, type(4), "EDGE_PREFIX"},
    /* 109 */ {0, 0, type(4), "EDGE_SUFFIX"},
    /* 110 */ {0, 0, type(0), "EDGE_WARN"},
    /* 111 */ {0, 0, type(0), "FUNC_ENABLE"},
    /* 112 */ {0, 0, type(2), "FUNC_LIMIT"},
    /* 113 */ {0, 0, type(2), "FUNC_SIZE"},
    /* 114 */ {0, 0, type(2), "FUNC_COUNT"},
    /* 115 */ {0, 0, type(4), "FUNC_DIR"},
    /* 116 */ {0, 0, type(4), "FUNC_FILE"},
    /* 117 */ {0, 0, type(1), "FUNC_MODE"},
    /* 118 */ {0, 0, type(0), "FUNC_CHECK"},
    /* 119 */ {0, 0, type(1), "FUNC_REPORT"},
    /* 120 */ {0, 0, type(1), "FUNC_INTERVAL"},
    /* 121 */ {0, 0, type(1), "FUNC_RETRY"},
    /* 122 */ {0, 0, type(2), "FUNC_ALIGN"},
    /* 123 */ {0, 0, type(1), "FUNC_FLUSH"},
    /* 124 */ {0, 0, type(4), "FUNC_PREFIX"},
    /* 125 */ {0, 0, type(4), "FUNC_SUFFIX"},
    /* 126 */ {0, 0, type(0), "FUNC_WARN"},
    /* 127 */ {0, 0, type(0), "FILE_ENABLE"},
    /* 128 */ {0, 0, type(2), "FILE_LIMIT"},
    /* 129 */ {0, 0, type(2), "FILE_SIZE"},
    /* 130 */ {0, 0, type(2), "FILE_COUNT"},
    /* 131 */ {0, 0, type(4), "FILE_DIR"},
    /* 132 */ {0, 0, type(4), "FILE_FILE"},
    /* 133 */ {0, 0, type(1), "FILE_MODE"},
    /* 134 */ {0, 0, type(0), "FILE_CHECK"},
    /* 135 */ {0, 0, type(1), "FILE_REPORT"},
    /* 136 */ {0, 0, type(1), "FILE_INTERVAL"},
    /* 137 */ {0, 0, type(1), "FILE_RETRY"},
    /* 138 */ {0, 0, type(2), "FILE_ALIGN"},
    /* 139 */ {0, 0, type(1), "FILE_FLUSH"},
    /* 140 */ {0, 0, type(4), "FILE_PREFIX"},
    /* 141 */ {0, 0, type(4), "FILE_SUFFIX"},
    /* 142 */ {0, 0, type(0), "FILE_WARN"},
    /* 143 */ {0, 0, type(0), "OBJECT_ENABLE"},
    /* 144 */ {0, 0, type(2), "OBJECT_LIMIT"},
    /* 145 */ {0, 0, type(2), "OBJECT_SIZE"},
    /* 146 */ {0, 0, type(2), "OBJECT_COUNT"},
    /* 147 */ {0, 0, type(4), "OBJECT_DIR"},
    /* 148 */ {0, 0, type(4), "OBJECT_FILE"},
    /* 149 */ {0, 0, type(1), "OBJECT_MODE"},
    /* 150 */ {0, 0, type(0), "OBJECT_CHECK"},
    /* 151 */ {0, 0, type(1), "OBJECT_REPORT"},
    /* 152 */ {0, 0, type(1), "OBJECT_INTERVAL"},
    /* 153 */ {0, 0, type(1), "OBJECT_RETRY"},
    /* 154 */ {0, 0, type(2), "OBJECT_ALIGN"},
    /* 155 */ {0, 0, type(1), "OBJECT_FLUSH"},
    /* 156 */ {0, 0, type(4), "OBJECT_PREFIX"},
    /* 157 */ {0, 0, type(4), "OBJECT_SUFFIX"},
    /* 158 */ {0, 0, type(0), "OBJECT_WARN"},
    /* 159 */ {0, 0, type(0), "ARCHIVE_ENABLE"},
    /* 160 */ {0, 0, type(2), "ARCHIVE_LIMIT"},
    /* 161 */ {0, 0, type(2), "ARCHIVE_SIZE"},
    /* 162 */ {0, 0, type(2), "ARCHIVE_COUNT"},
    /* 163 */ {0, 0, type(4), "ARCHIVE_DIR"},
    /* 164 */ {0, 0, type(4), "ARCHIVE_FILE"},
    /* 165 */ {0, 0, type(1), "ARCHIVE_MODE"},
    /* 166 */ {0, 0, type(0), "ARCHIVE_CHECK"},
    /* 167 */ {0, 0, type(1), "ARCHIVE_REPORT"},
    /* 168 */ {0, 0, type(1), "ARCHIVE_INTERVAL"},
    /* 169 */ {0, 0, type(1), "ARCHIVE_RETRY"},
    /* 170 */ {0, 0, type(2), "ARCHIVE_ALIGN"},
    /* 171 */ {0, 0, type(1), "ARCHIVE_FLUSH"},
    /* 172 */ {0, 0, type(4), "ARCHIVE_PREFIX"},
    /* 173 */ {0, 0, type(4), "ARCHIVE_SUFFIX"},
    /* 174 */ {0, 0, type(0), "ARCHIVE_WARN"},
    /* 175 */ {0, 0, type(0), "CACHE_ENABLE"},
    /* 176 */ {0, 0, type(2), "CACHE_LIMIT"},
    /* 177 */ {0, 0, type(2), "CACHE_COUNT"},
    /* 178 */ {0, 0, type(4), "CACHE_FILE"},
    /* 179 */ {0, 0, type(1), "CACHE_MODE"},
    /* 180 */ {0, 0, type(0), "CACHE_CHECK"},
    /* 181 */ {0, 0, type(1), "CACHE_REPORT"},
    /* 182 */ {0, 0, type(1), "CACHE_INTERVAL"},
    /* 183 */ {0, 0, type(1), "CACHE_RETRY"},
    /* 184 */ {0, 0, type(2), "CACHE_ALIGN"},
    /* 185 */ {0, 0, type(1), "CACHE_FLUSH"},
    /* 186 */ {0, 0, type(4), "CACHE_PREFIX"},
    /* 187 */ {0, 0, type(4), "CACHE_SUFFIX"},
    /* 188 */ {0, 0, type(0), "CACHE_WARN"},
    /* 189 */ {0, 0, type(0), "THREAD_ENABLE"},
    /* 190 */ {0, 0, type(2), "THREAD_LIMIT"},
    /* 191 */ {0, 0, type(2), "THREAD_SIZE"},
    /* 192 */ {0, 0, type(2), "THREAD_COUNT"},
    /* 193 */ {0, 0, type(4), "THREAD_DIR"},
    /* 194 */ {0, 0, type(4), "THREAD_FILE"},
    /* 195 */ {0, 0, type(1), "THREAD_MODE"},
    /* 196 */ {0, 0, type(0), "THREAD_CHECK"},
    /* 197 */ {0, 0, type(1), "THREAD_REPORT"},
    /* 198 */ {0, 0, type(1), "THREAD_INTERVAL"},
    /* 199 */ {0, 0, type(1), "THREAD_RETRY"},
    /* 200 */ {0, 0, type(2), "THREAD_ALIGN"},
    /* 201 */ {0, 0, type(1), "THREAD_FLUSH"},
    /* 202 */ {0, 0, type(4), "THREAD_PREFIX"},
    /* 203 */ {0, 0, type(4), "THREAD_SUFFIX"},
    /* 204 */ {0, 0, type(0), "THREAD_WARN"},
    /* 205 */ {0, 0, type(0), "SIGNAL_ENABLE"},
    /* 206 */ {0, 0, type(2), "SIGNAL_LIMIT"},
    /* 207 */ {0, 0, type(2), "SIGNAL_SIZE"},
    /* 208 */ {0, 0, type(2), "SIGNAL_COUNT"},
    /* 209 */ {0, 0, type(4), "SIGNAL_DIR"},
    /* 210 */ {0, 0, type(4), "SIGNAL_FILE"},
    /* 211 */ {0, 0, type(1), "SIGNAL_MODE"},
    /* 212 */ {0, 0, type(0), "SIGNAL_CHECK"},
    /* 213 */ {0, 0, type(1), "SIGNAL_REPORT"},
    /* 214 */ {0, 0, type(1), "SIGNAL_INTERVAL"},
    /* 215 */ {0, 0, type(1), "SIGNAL_RETRY"},
    /* 216 */ {0, 0, type(2), "SIGNAL_ALIGN"},
    /* 217 */ {0, 0, type(1), "SIGNAL_FLUSH"},
    /* 218 */ {0, 0, type(4), "SIGNAL_PREFIX"},
    /* 219 */ {0, 0, type(4), "SIGNAL_SUFFIX"},
    /* 220 */ {0, 0, type(0), "SIGNAL_WARN"},
    /* 221 */ {0, 0, type(0), "HEAP_ENABLE"},
    /* 222 */ {0, 0, type(2), "HEAP_LIMIT"},
    /* 223 */ {0, 0, kBootstrap | type(4), "KESTREL_HOME"},
    /* 224 */ {0, 0, type(2), "HEAP_COUNT"},
    /* 225 */ {0, 0, type(4), "HEAP_DIR"},
    /* 226 */ {0, 0, type(4), "HEAP_FILE"},
    /* 227 */ {0, 0, type(1), "HEAP_MODE"},
    /* 228 */ {0, 0, type(0), "HEAP_CHECK"},
    /* 229 */ {0, 0, type(1), "HEAP_REPORT"},
    /* 230 */ {0, 0, type(1), "HEAP_INTERVAL"},
    /* 231 */ {0, 0, type(1), "HEAP_RETRY"},
    /* 232 */ {0, reinterpret_cast<std::intptr_t>("/tmp_mnt"), type(4), "AUTO_MOUNT_PREFIX"},
    /* 233 */ {0, 0, type(2), "HEAP_ALIGN"},
    /* 234 */ {0, 0, type(1), "HEAP_FLUSH"},
    /* 235 */ {0, 0, type(4), "HEAP_PREFIX"},
    /* 236 */ {0, 0, type(4), "HEAP_SUFFIX"},
    /* 237 */ {0, 0, type(0), "HEAP_WARN"},
    /* 238 */ {0, 0, type(0), "STACK_ENABLE"},
    /* 239 */ {0, 0, type(2), "STACK_LIMIT"},
    /* 240 */ {0, 0, type(2), "STACK_COUNT"},
    /* 241 */ {0, 0, type(4), "STACK_DIR"},
    /* 242 */ {0, 0, type(4), "STACK_FILE"},
    /* 243 */ {0, 0, type(1), "STACK_MODE"},
    /* 244 */ {0, 0, type(0), "STACK_CHECK"},
    /* 245 */ {0, 0, type(1), "STACK_REPORT"},
    /* 246 */ {0, 0, type(1), "STACK_INTERVAL"},
    /* 247 */ {0, 0, type(1), "STACK_RETRY"},
    /* 248 */ {0, 0, type(2), "STACK_ALIGN"},
    /* 249 */ {0, 0, type(1), "STACK_FLUSH"},
    /* 250 */ {0, 0, type(4), "STACK_PREFIX"},
    /* 251 */ {0, 0, type(4), "STACK_SUFFIX"},
    /* 252 */ {0, 0, type(0), "STACK_WARN"},
    /* 253 */ {0, 0, type(0), "TRACE_ENABLE"},
    /* 254 */ {0, 0, type(2), "TRACE_LIMIT"},
    /* 255 */ {0, 0, type(2), "TRACE_SIZE"},
    /* 256 */ {0, 0, type(2), "TRACE_COUNT"},
    /* 257 */ {0, 0, type(4), "TRACE_DIR"},
    /* 258 */ {0, 0, type(4), "TRACE_FILE"},
    /* 259 */ {0, 0, type(1), "TRACE_MODE"},
    /* 260 */ {0, 0, type(0), "TRACE_CHECK"},
    /* 261 */ {0, 0, type(1), "TRACE_REPORT"},
    /* 262 */ {0, 0, type(1), "TRACE_INTERVAL"},
    /* 263 */ {0, 0, type(1), "TRACE_RETRY"},
    /* 264 */ {0, 0, type(2), "TRACE_ALIGN"},
    /* 265 */ {0, 0, type(1), "TRACE_FLUSH"},
    /* 266 */ {0, 0, type(4), "TRACE_PREFIX"},
    /* 267 */ {0, 0, type(4), "TRACE_SUFFIX"},
    /* 268 */ {0, 0, type(0), "TRACE_WARN"},
    /* 269 */ {0, 0, type(0), "LOG_ENABLE"},
    /* 270 */ {0, 0, type(2), "LOG_LIMIT"},
    /* 271 */ {0, 0, type(2), "LOG_SIZE"},
    /* 272 */ {0, 0, type(2), "LOG_COUNT"},
    /* 273 */ {0, 0, type(4), "LOG_DIR"},
    /* 274 */ {0, 0, type(4), "LOG_FILE"},
    /* 275 */ {0, 0, type(1), "LOG_MODE"},
    /* 276 */ {0, 0, type(0), "LOG_CHECK"},
    /* 277 */ {0, 0, type(1), "LOG_REPORT"},
    /* 278 */ {0, 20, type(1), "QUOR_HELP_MAX_WAIT"},
    /* 279 */ {0, 0, type(1), "LOG_INTERVAL"},
    /* 280 */ {0, 0, type(1), "LOG_RETRY"},
    /* 281 */ {0, 0, type(2), "LOG_ALIGN"},
    /* 282 */ {0, 0, type(1), "LOG_FLUSH"},
    /* 283 */ {0, 0, type(4), "LOG_PREFIX"},
    /* 284 */ {0, 0, type(4), "LOG_SUFFIX"},
    /* 285 */ {0, 0, type(0), "LOG_WARN"},
    /* 286 */ {0, 0, type(0), "DUMP_ENABLE"},
    /* 287 */ {0, 0, type(2), "DUMP_LIMIT"},
    /* 288 */ {0, 0, type(2), "DUMP_SIZE"},
    /* 289 */ {0, 0, type(2), "DUMP_COUNT"},
    /* 290 */ {0, 0, type(4), "DUMP_DIR"},
    /* 291 */ {0, 0, type(4), "DUMP_FILE"},
    /* 292 */ {0, 0, type(1), "DUMP_MODE"},
    /* 293 */ {0, 0, type(0), "DUMP_CHECK"},
    /* 294 */ {0, 0, type(1), "DUMP_REPORT"},
    /* 295 */ {0, 0, type(1), "DUMP_INTERVAL"},
    /* 296 */ {0, 0, type(1), "DUMP_RETRY"},
    /* 297 */ {0, 0, type(2), "DUMP_ALIGN"},
    /* 298 */ {0, 0, type(1), "DUMP_FLUSH"},
    /* 299 */ {0, 0, type(4), "DUMP_PREFIX"},
    /* 300 */ {0, 0, type(4), "DUMP_SUFFIX"},
    /* 301 */ {0, 0, type(0), "DUMP_WARN"},
    /* 302 */ {0, 0, type(0), "MAP_ENABLE"},
    /* 303 */ {0, 0, type(2), "MAP_LIMIT"},
    /* 304 */ {0, 0, type(2), "MAP_SIZE"},
    /* 305 */ {0, 0, type(2), "MAP_COUNT"},
    /* 306 */ {0, 0, type(4), "MAP_DIR"},
    /* 307 */ {0, 0, type(4), "MAP_FILE"},
    /* 308 */ {0, 0, type(1), "MAP_MODE"},
    /* 309 */ {0, 0, type(0), "MAP_CHECK"},
    /* 310 */ {0, 0, type(1), "MAP_REPORT"},
    /* 311 */ {0, 0, type(1), "MAP_INTERVAL"},
    /* 312 */ {0, 0, type(1), "MAP_RETRY"},
    /* 313 */ {0, 0, type(2), "MAP_ALIGN"},
    /* 314 */ {0, 0, type(1), "MAP_FLUSH"},
    /* 315 */ {0, 0, type(4), "MAP_PREFIX"},
    /* 316 */ {0, 0, type(4), "MAP_SUFFIX"},
    /* 317 */ {0, 0, type(0), "MAP_WARN"},
    /* 318 */ {0, 0, type(0), "STRING_ENABLE"},
    /* 319 */ {0, 0, type(2), "STRING_LIMIT"},
    /* 320 */ {0, 0, type(2), "STRING_SIZE"},
    /* 321 */ {0, 0, type(2), "STRING_COUNT"},
    /* 322 */ {0, 0, type(4), "STRING_DIR"},
    /* 323 */ {0, 0, type(4), "STRING_FILE"},
    /* 324 */ {0, 0, type(1), "STRING_MODE"},
    /* 325 */ {0, 0, type(0), "STRING_CHECK"},
    /* 326 */ {0, 0, type(1), "STRING_REPORT"},
    /* 327 */ {0, 0, type(1), "STRING_INTERVAL"},
    /* 328 */ {0, 0, type(1), "STRING_RETRY"},
    /* 329 */ {0, 0, type(2), "STRING_ALIGN"},
    /* 330 */ {0, 0, type(1), "STRING_FLUSH"},
    /* 331 */ {0, 0, type(4), "STRING_PREFIX"},
    /* 332 */ {0, 0, type(4), "STRING_SUFFIX"},
    /* 333 */ {0, 0, type(0), "STRING_WARN"},
    /* 334 */ {0, 0, type(0), "SESSION_ENABLE"},
    /* 335 */ {0, 0, type(2), "SESSION_LIMIT"},
    /* 336 */ {0, 0, type(2), "SESSION_SIZE"},
    /* 337 */ {0, 0, type(2), "SESSION_COUNT"},
    /* 338 */ {0, 0, type(4), "SESSION_DIR"},
    /* 339 */ {0, 0, type(4), "SESSION_FILE"},
    /* 340 */ {0, 0, type(1), "SESSION_MODE"},
    /* 341 */ {0, 0, type(0), "SESSION_CHECK"},
    /* 342 */ {0, 0, type(1), "SESSION_REPORT"},
    /* 343 */ {0, 0, type(1), "SESSION_INTERVAL"},
    /* 344 */ {0, 0, type(1), "SESSION_RETRY"},
    /* 345 */ {0, 0, type(2), "SESSION_ALIGN"},
    /* 346 */ {0, 0, type(1), "SESSION_FLUSH"},
    /* 347 */ {0, 0, type(4), "SESSION_PREFIX"},
    /* 348 */ {0, 0, type(4), "SESSION_SUFFIX"},
    /* 349 */ {0, 0, type(0), "SESSION_WARN"},
    /* 350 */ {0, 0, type(0), "TIMER_ENABLE"},
    /* 351 */ {0, 0, type(2), "TIMER_LIMIT"},
    /* 352 */ {0, 0, type(2), "TIMER_SIZE"},
    /* 353 */ {0, 0, type(2), "TIMER_COUNT"},
    /* 354 */ {0, 0, type(4), "TIMER_DIR"},
    /* 355 */ {0, 0, type(4), "TIMER_FILE"},
    /* 356 */ {0, 0, type(1), "TIMER_MODE"},
    /* 357 */ {0, 0, type(0), "TIMER_CHECK"},
    /* 358 */ {0, 0, type(1), "TIMER_REPORT"},
    /* 359 */ {0, 0, type(1), "TIMER_INTERVAL"},
    /* 360 */ {0, 0, type(1), "TIMER_RETRY"},
    /* 361 */ {0, 0, type(2), "TIMER_ALIGN"},
    /* 362 */ {0, 0, type(1), "TIMER_FLUSH"},
    /* 363 */ {0, 0, type(4), "TIMER_PREFIX"},
    /* 364 */ {0, 0, type(4), "TIMER_SUFFIX"},
    /* 365 */ {0, 0, type(0), "TIMER_WARN"},
    /* 366 */ {0, 0, type(0), "PROBE_ENABLE"},
    /* 367 */ {0, 0, type(2), "PROBE_LIMIT"},
    /* 368 */ {0, 0, type(2), "PROBE_SIZE"},
    /* 369 */ {0, 0, type(2), "PROBE_COUNT"},
    /* 370 */ {0, 0, type(4), "PROBE_DIR"},
    /* 371 */ {0, 0, type(4), "PROBE_FILE"},
    /* 372 */ {0, 0, type(1), "PROBE_MODE"},
    /* 373 */ {0, 0, type(0), "PROBE_CHECK"},
    /* 374 */ {0, 0, type(1), "PROBE_REPORT"},
    /* 375 */ {0, 0, type(1), "PROBE_INTERVAL"},
    /* 376 */ {0, 0, type(1), "PROBE_RETRY"},
    /* 377 */ {0, 0, type(2), "PROBE_ALIGN"},
    /* 378 */ {0, 0, type(1), "PROBE_FLUSH"},
    /* 379 */ {0, 0, type(4), "PROBE_PREFIX"},
    /* 380 */ {0, 0, type(4), "PROBE_SUFFIX"},
    /* 381 */ {0, 0, type(0), "PROBE_WARN"},
    /* 382 */ {0, 0, type(0), "COUNTER_ENABLE"},
    /* 383 */ {0, 0, type(2), "COUNTER_LIMIT"},
    /* 384 */ {0, 0, type(2), "COUNTER_SIZE"},
    /* 385 */ {0, 0, type(2), "COUNTER_COUNT"},
    /* 386 */ {0, 0, type(4), "COUNTER_DIR"},
    /* 387 */ {0, 0, type(4), "COUNTER_FILE"},
    /* 388 */ {0, 0, type(1), "COUNTER_MODE"},
    /* 389 */ {0, 0, type(0), "COUNTER_CHECK"},
    /* 390 */ {0, 0, type(1), "COUNTER_REPORT"},
    /* 391 */ {0, 0, type(1), "COUNTER_INTERVAL"},
};

struct Table {
  RuntimeOption rows[kRuntimeOptionCount];
  Table() { reset(); }
  void reset() {
    for (int i = 0; i < kRuntimeOptionCount; ++i) rows[i] = kInitial[i];
  }
};
Table gTable;
RuntimeOption* const kTable = gTable.rows;


// Owned copies of string values set at run time; a list keeps earlier pointers valid.
std::list<std::string>& stringStore() {
  static std::list<std::string> store;
  return store;
}

// "AUTO_MOUNT_PREFIX" is shown as "auto-mount-prefix".
std::string displayName(const char* name) {
  std::string n = name;
  if (n.size() >= 256) return n;
  for (char& c : n) {
    if (c >= 'A' && c <= 'Z') c = static_cast<char>(c - 'A' + 'a');
    else if (c == '_') c = '-';
  }
  return n;
}

RuntimeOption& checked(int index) {
  if (index < 0 || index >= kRuntimeOptionCount) {
    kgFatal("Internal error: option index %d out of range.", index);
  }
  return kTable[index];
}

}  // namespace

RuntimeOption* runtimeOptions() { return kTable; }

void setOption(int index, std::intptr_t value) {
  RuntimeOption& o = checked(index);
  o.value = value;
  o.flags |= kSet;
}

void setStringOption(int index, const char* value) {
  if (!value) {
    setOption(index, 0);
    return;
  }
  stringStore().emplace_back(value);
  setOption(index, reinterpret_cast<std::intptr_t>(stringStore().back().c_str()));
}

std::intptr_t getOption(int index) {
  const RuntimeOption& o = checked(index);
  return (o.flags & kSet) ? o.value : o.defaultValue;
}

const char* getStringOption(int index) {
  const RuntimeOption& o = checked(index);
  if (typeOf(o) != optString)
    kgFatal("Internal error: option %s is not a string option.", displayName(o.name).c_str());
  return reinterpret_cast<const char*>(getOption(index));
}

long getIntOption(int index) {
  const RuntimeOption& o = checked(index);
  int t = typeOf(o);
  if (t != optInt && t != optUnsigned && t != optInt2)
    kgFatal("Internal error: option %s is not an integer option.", displayName(o.name).c_str());
  return static_cast<long>(getOption(index));
}

unsigned long getUnsignedOption(int index) {
  const RuntimeOption& o = checked(index);
  if (typeOf(o) != optUnsigned)
    kgFatal("Internal error: option %s is not an unsigned integer option.",
            displayName(o.name).c_str());
  return static_cast<unsigned long>(getOption(index));
}

bool getBoolOption(int index) {
  const RuntimeOption& o = checked(index);
  if (typeOf(o) != optBool)
    kgFatal("Internal error: option %s is not a boolean option.", displayName(o.name).c_str());
  return getOption(index) != 0;
}

void resetRuntimeOptions() { gTable.reset(); }

namespace {
// The split of AUTO_MOUNT_PREFIX, redone only when the option's value changes.
struct MountSplit {
  bool valid = false;
  std::string source;  // the option value the split was made from
  std::string prefix, replacement;
};
MountSplit gSplit;
std::string gTranslated;
}  // namespace

const char* translateAutoMountPath(const char* path) {
  if (!path) return nullptr;
  const char* value = getStringOption(AUTO_MOUNT_PREFIX);
  std::string v = value ? value : "";
  if (!gSplit.valid || gSplit.source != v) {
    gSplit.source = v;
    size_t colon = v.find(':');
    gSplit.prefix = colon == std::string::npos ? v : v.substr(0, colon);
    gSplit.replacement = colon == std::string::npos ? std::string() : v.substr(colon + 1);
    gSplit.valid = true;
  }
  const std::string& prefix = gSplit.prefix;
  if (!prefix.empty() && strncmp(path, prefix.c_str(), prefix.size()) == 0)
    gTranslated = gSplit.replacement + (path + prefix.size());
  else
    gTranslated = path;
  if (gTranslated.size() > 4095) gTranslated.resize(4095);  // results are bounded to 4096 bytes
  return gTranslated.c_str();
}
