/**
 * @file
 * The plain types that the subsystems share. Records are open: hosts and host classes read and
 * write their fields, but only read those of containers. A field says unit, owner, initial value
 * and who changes it where that is not plain.
 *
 * "Owned" means: allocated with OslMemoryMalloc() and freed together with the record.
 */
#ifndef QLX_TYPES_H
#define QLX_TYPES_H

#include <pthread.h>
#include <qlx/base.h>

QLX_BEGIN_DECLS

/* ---- Platform ---------------------------------------------------------------------------- */

/** What a platform operation answers. */
typedef struct CxStatus {
  char kind;    /**< '-' success, 'p' a system error */
  int32_t code; /**< 0 on success, else the system's error number */
} CxStatus;

typedef int32_t CxFile;           /**< a file descriptor; -1 is closed */
typedef void *CxDirectory;        /**< an open directory; null is closed */
typedef pthread_mutex_t *CxMutex; /**< null means that there is no mutex */
typedef pthread_t CxThread;

/** Growable 8-bit text; all zero is an empty buffer. */
typedef struct CxStringBuff {
  uint32_t length;   /**< bytes in use, without the terminator */
  uint32_t capacity; /**< bytes allocated */
  char *data;        /**< owned block, null until the first append; data[length] is 0 */
} CxStringBuff;

/** Growable UTF-16 text; all zero is an empty buffer. */
typedef struct CxUStringBuff {
  uint32_t length;   /**< code units in use, without the terminator */
  uint32_t capacity; /**< BYTES allocated */
  UChar *data;       /**< owned block, null until the first append; data[length] is 0 */
} CxUStringBuff;

/** A path with "/" as its only separator. */
typedef struct CxFilePath {
  char path[256];
  int32_t length;  /**< index of the terminator; -1: invalid, or longer than 255 characters */
  int32_t lastSep; /**< index of the last "/"; -1: none */
} CxFilePath;

/** Size in bytes; times in seconds since 1970-01-01 UTC. */
typedef struct CxFileInfo {
  int64_t size, changeTime, modTime, accessTime;
} CxFileInfo;

typedef struct CxPropEntry {
  char *key, *value; /**< both owned, never null */
} CxPropEntry;

/** Keys and values in one growable array; all zero is an empty list. */
typedef struct CxPropList {
  int32_t count;        /**< entries in use */
  int32_t capacity;     /**< entries allocated */
  CxPropEntry *entries; /**< owned array */
} CxPropList;

/** A position in a property list. */
typedef struct CxPropListIter {
  CxPropList *list; /**< null at the end */
  int32_t index;
} CxPropListIter;

/* ---- Containers (their records stand in qlx/containers/) ----------------------------------- */

typedef struct ListenerGroup ListenerGroup;
typedef struct ListenerGroupNode ListenerGroupNode;
typedef struct StringGroup StringGroup;
typedef struct StringGroupNode StringGroupNode;
typedef struct ParmList ParmList;
typedef struct ParmListNode ParmListNode;
typedef struct StringList StringList;
typedef struct StringListNode StringListNode;
typedef struct StringToObjCfgMap StringToObjCfgMap;
typedef struct StringToObjCfgMapNode StringToObjCfgMapNode;
typedef struct StringToObjClassMap StringToObjClassMap;
typedef struct StringToObjClassMapNode StringToObjClassMapNode;
typedef struct StringToObjMap StringToObjMap;
typedef struct StringToObjMapNode StringToObjMapNode;
typedef struct StringToStringMap StringToStringMap;
typedef struct StringToStringMapNode StringToStringMapNode;

/* ---- Properties and parameters -------------------------------------------------------------- */

/** Type codes of a Parm. */
typedef enum ParmType {
  ParmByte = 501,
  ParmInt32 = 502,
  ParmInt64 = 503,
  ParmFloat32 = 504,
  ParmFloat64 = 505,
  ParmChar = 506,
  ParmString = 507
} ParmType;

/** A typed value. */
typedef struct Parm {
  int32_t type; /**< a ParmType */
  union {
    char c;    /**< ParmByte, ParmChar */
    int32_t i; /**< ParmInt32 */
    int64_t l; /**< ParmInt64 */
    float f;   /**< ParmFloat32 */
    double d;  /**< ParmFloat64 */
    char *s;   /**< ParmString, owned */
  } value;
} Parm;

/** A tokenizer's position: passed and returned by value, owns nothing. */
typedef struct QlxStrTok {
  const char *cursor; /**< the rest of the caller's string */
  const char *delims; /**< the caller's delimiter bytes; null or empty: every byte is a token */
} QlxStrTok;

/* ---- Levels ---------------------------------------------------------------------------------- */

/** Severities; any other int32_t is a level too and compares by its value. */
typedef enum Level {
  OFF = 9999, /**< a threshold above every named level */
  FATAL = 7000,
  ERROR = 6000,
  WARN = 5000,
  INFO = 4000,
  DEBUG_MIN = 3000, /**< the threshold of a new logger */
  DEBUG_MID = 2000,
  DEBUG_MAX = 1000,
  ALL = 0,            /**< a threshold below every real level */
  UNSPECIFIED = -9999 /**< no level: passes every threshold, and as a threshold passes all */
} Level;

/* ---- Objects -----------------------------------------------------------------------------------
 */

typedef struct ObjCfg ObjCfg; /**< a named configuration, opaque */
typedef struct ObjClass ObjClass;
typedef struct QlxObject QlxObject;
typedef struct Event Event;
typedef struct I18Msg I18Msg;

/** Kinds of classes and of their objects. */
typedef enum ObjKind { Logger = 101, Filter = 102, Handler = 103, Formatter = 104 } ObjKind;

/*
 * Operations of a class. They run with the API lock held and may call only functions that take no
 * lock: the qlxIntl... twins, the qlx... helpers and the Qlx<Class>F<Operation> operations. `args`
 * is the argument list of the log call, may be null, and is consumed only through a va_copy. A C++
 * exception that leaves an operation ends the process (qlx/class.h).
 */
typedef void *(*fAllocVars)(void);     /**< variables of a new object, or null */
typedef void (*fFreeVars)(void *vars); /**< frees them; also called with null */
typedef void (*fCfgChange)(QlxObject *object, const char *key); /**< the key may be null */
typedef void (*fLog)(QlxObject *object, Event *event, va_list *args);
typedef void (*fProcess)(QlxObject *object, Event *event, va_list *args);
typedef uint8_t (*fIsLoggable)(QlxObject *filter, Event *event, va_list *args);
typedef void (*fOpen)(QlxObject *handler); /**< for the class itself: the library calls none */
typedef void (*fClose)(QlxObject *handler);
typedef UChar *(*fFormat)(QlxObject *formatter, Event *event, va_list *args); /**< caller frees */
typedef char *(*fGetHeader)(QlxObject *formatter);                            /**< caller frees */
typedef char *(*fGetTrailer)(QlxObject *formatter);                           /**< caller frees */
typedef UChar *(*fBindMsg)(I18Msg *message, va_list *args);                   /**< caller frees */

/** A registered class; owned by the class registry, not counted. */
struct ObjClass {
  int32_t kind;        /**< an ObjKind */
  const char *name;    /**< owned; the registry key */
  I18Msg *description; /**< owned, may be null */
  union {
    void (*fLog)(QlxObject *, Event *, va_list *);      /**< loggers */
    void (*fProcess)(QlxObject *, Event *, va_list *);  /**< filters and handlers */
    UChar *(*fFormat)(QlxObject *, Event *, va_list *); /**< formatters */
  } op1;
  union {
    uint8_t (*fIsLoggable)(QlxObject *, Event *, va_list *); /**< filters */
    void (*fOpen)(QlxObject *);                              /**< handlers */
    char *(*fGetHeader)(QlxObject *);                        /**< formatters */
  } op2;
  union {
    void (*fLog)(QlxObject *, Event *, va_list *); /**< filters */
    void (*fClose)(QlxObject *);                   /**< handlers */
    char *(*fGetTrailer)(QlxObject *);             /**< formatters */
  } op3;
  union {
    UChar *(*fBindMsg)(I18Msg *, va_list *); /**< formatters */
  } op4;
  void *(*fAllocVars)(void);
  void (*fFreeVars)(void *);
  void (*fCfgChange)(QlxObject *, const char *);
  const struct QlxOwnClass *own; /**< the library's own; null in a host's record */
};

/** The header of every object. Changed only under the API lock. */
struct QlxObject {
  ObjClass *objClass; /**< borrowed; null once the toolkit was closed under a held handle */
  uint32_t refCount;
  char *name;      /**< owned; the registry key */
  uint8_t enabled; /**< 1 at creation; 0: passes no event on. Read without the lock: atomically */
  union {
    int32_t level;            /**< loggers (3000 at creation) and filters (0). As `enabled` */
    ListenerGroup *listeners; /**< handlers: owned, null until the first is added */
    char *separator;          /**< formatters: owned, null is one blank */
    uint64_t word;
  } kind1;
  union {
    ListenerGroup *listeners; /**< loggers and filters: owned, null until the first is added */
    QlxObject *formatter;     /**< handlers: one counted reference, or null */
    char *dateTimeFormat;     /**< formatters: owned, null is the default pattern */
    uint64_t word;
  } kind2;
  union {
    void *handlerWord; /**< handlers: unused, null */
    char *locale;      /**< formatters: owned, null leaves the event's locale alone */
    uint64_t word;
  } kind3;
  StringToStringMap *props; /**< owned, null until the first property is set */
  void *vars;               /**< what fAllocVars returned; freed by fFreeVars */
  uint8_t marks;            /**< private to the object model */
};

/** A message: a bundle and a key that select a pattern, or the pattern itself. */
struct I18Msg {
  char *bundle;    /**< owned or null: name or path of an ICU resource bundle */
  char *key;       /**< owned or null: key of the pattern in the bundle */
  UChar *text;     /**< owned or null: the pattern when bundle is null */
  ParmList *parms; /**< owned, null until asked for */
  char *locale;    /**< null is ICU's default locale; copies share it */
  int32_t error;   /**< ICU's code of the last failed bind, else 0 */
  uint8_t shared;  /**< private: 1 when a copy shares `locale` */
};

/** One log request on its way; lives for the one call. */
struct Event {
  uint8_t isMessage;        /**< 1: a bundle's message, 0: plain or debug text */
  double time;              /**< milliseconds since 1970-01-01 UTC, a whole number */
  int32_t level;            /**< a Level or a number between */
  I18Msg *message;          /**< owned; null only when memory ran out */
  char *messageId;          /**< owned or null */
  char *locale;             /**< owned or null: overrides the message's */
  StringToStringMap *props; /**< owned, null until the first property is set */
  CxStatus status;          /**< what the host gets back; handlers store a failure here */
};

/** What a log call answers: {'-', 0, 0} also when nothing was logged. */
typedef struct QlxLogResult {
  char statusKind;    /**< kind of the event's status */
  int32_t statusCode; /**< code of the event's status */
  int32_t msgStatus;  /**< ICU's code of the last failed bind, else 0 */
} QlxLogResult;

QLX_END_DECLS

#endif
