/**
 * @file
 * CMPI 2.0 (The Open Group, C061): data types, type codes, value states and return codes.
 *
 * The numbers, the order of members and their types are the binary interface between an object manager and its
 * providers; none may change. Sizes are those of LP64.
 */
#ifndef CMPI_CMPIDT_H
#define CMPI_CMPIDT_H

#include "cmpios.h"

#include <stddef.h>

#ifdef __cplusplus
extern "C" {
#endif

/** Value of `ftVersion`, `miVersion` and `brokerVersion` in tables laid out as CMPI 2.0 has them. */
#define CMPIVersion200 200
#ifndef CMPI_VERSION
#define CMPI_VERSION CMPIVersion200
#endif

/* Encapsulated objects, management interfaces and their function tables: laid out in cmpift.h. */
typedef struct _CMPIBroker CMPIBroker;
typedef struct _CMPIBrokerFT CMPIBrokerFT;
typedef struct _CMPIBrokerEncFT CMPIBrokerEncFT;
typedef struct _CMPIBrokerExtFT CMPIBrokerExtFT;
typedef struct _CMPIBrokerMemFT CMPIBrokerMemFT;
typedef struct _CMPIContext CMPIContext;
typedef struct _CMPIContextFT CMPIContextFT;
typedef struct _CMPIResult CMPIResult;
typedef struct _CMPIResultFT CMPIResultFT;
typedef struct _CMPIString CMPIString;
typedef struct _CMPIStringFT CMPIStringFT;
typedef struct _CMPIArray CMPIArray;
typedef struct _CMPIArrayFT CMPIArrayFT;
typedef struct _CMPIEnumeration CMPIEnumeration;
typedef struct _CMPIEnumerationFT CMPIEnumerationFT;
typedef struct _CMPIInstance CMPIInstance;
typedef struct _CMPIInstanceFT CMPIInstanceFT;
typedef struct _CMPIObjectPath CMPIObjectPath;
typedef struct _CMPIObjectPathFT CMPIObjectPathFT;
typedef struct _CMPIArgs CMPIArgs;
typedef struct _CMPIArgsFT CMPIArgsFT;
typedef struct _CMPIDateTime CMPIDateTime;
typedef struct _CMPIDateTimeFT CMPIDateTimeFT;
typedef struct _CMPISelectExp CMPISelectExp;
typedef struct _CMPISelectExpFT CMPISelectExpFT;
typedef struct _CMPISelectCond CMPISelectCond;
typedef struct _CMPISelectCondFT CMPISelectCondFT;
typedef struct _CMPISubCond CMPISubCond;
typedef struct _CMPISubCondFT CMPISubCondFT;
typedef struct _CMPIPredicate CMPIPredicate;
typedef struct _CMPIPredicateFT CMPIPredicateFT;
typedef struct _CMPIError CMPIError;
typedef struct _CMPIErrorFT CMPIErrorFT;
typedef struct _CMPIInstanceMI CMPIInstanceMI;
typedef struct _CMPIInstanceMIFT CMPIInstanceMIFT;
typedef struct _CMPIAssociationMI CMPIAssociationMI;
typedef struct _CMPIAssociationMIFT CMPIAssociationMIFT;
typedef struct _CMPIMethodMI CMPIMethodMI;
typedef struct _CMPIMethodMIFT CMPIMethodMIFT;
typedef struct _CMPIPropertyMI CMPIPropertyMI;
typedef struct _CMPIPropertyMIFT CMPIPropertyMIFT;
typedef struct _CMPIIndicationMI CMPIIndicationMI;
typedef struct _CMPIIndicationMIFT CMPIIndicationMIFT;

/* Scalar types. */
typedef unsigned char CMPIBoolean;
typedef unsigned short CMPIChar16;
typedef unsigned char CMPIUint8;
typedef unsigned short CMPIUint16;
typedef unsigned int CMPIUint32;
typedef unsigned long long CMPIUint64;
typedef signed char CMPISint8;
typedef short CMPISint16;
typedef int CMPISint32;
typedef long long CMPISint64;
typedef float CMPIReal32;
typedef double CMPIReal64;
typedef unsigned int CMPICount;
typedef unsigned short CMPIType;
typedef unsigned short CMPIValueState;
typedef unsigned int CMPIFlags;
typedef int CMPIVersion;
typedef void* CMPIMsgFileHandle;
typedef void CMPIGcStat;

/* Threads of the broker's extended function table. */
typedef CMPI_THREAD_RETURN(CMPI_THREAD_CDECL* CMPIThreadFunc)(void*);
typedef void (*CMPIThreadOnceFunc)(void);
typedef void (*CMPIThreadKeyCleanupFunc)(void*);

/** Opaque bytes of a CMPI_ptr or CMPI_charsptr value. */
typedef struct _CMPIValuePtr {
    void* ptr;
    CMPICount length; /**< in bytes */
} CMPIValuePtr;

/**
 * A value of any CMPI type; which member counts is told by the CMPIType that travels with it.
 *
 * Wherever a `const CMPIValue *` of type CMPI_chars is passed in, the pointer is the `const char *` itself, cast. All
 * other types pass the address of a union, or of a bare variable of the member's type.
 */
typedef union _CMPIValue {
    CMPIBoolean boolean;
    CMPIChar16 char16;
    CMPIUint8 uint8;
    CMPIUint16 uint16;
    CMPIUint32 uint32;
    CMPIUint64 uint64;
    CMPISint8 sint8;
    CMPISint16 sint16;
    CMPISint32 sint32;
    CMPISint64 sint64;
    CMPIReal32 real32;
    CMPIReal64 real64;
    CMPIInstance* inst;
    CMPIObjectPath* ref;
    CMPIArgs* args;
    CMPISelectExp* filter;
    CMPIEnumeration* Enum;
    CMPIArray* array;
    CMPIString* string;
    char* chars;
    CMPIDateTime* dateTime;
    CMPIValuePtr dataPtr;
    CMPISint8 Byte;
    CMPISint16 Short;
    CMPISint32 Int;
    CMPISint64 Long;
    CMPIReal32 Float;
    CMPIReal64 Double;
} CMPIValue;

/** A typed value as read from an instance, a path, an array, arguments, a context or an enumeration. */
typedef struct _CMPIData {
    CMPIType type;
    CMPIValueState state; /**< flags; test CMPI_nullValue, data of a key carries CMPI_keyValue as well */
    CMPIValue value;
} CMPIData;

/* Type codes (CMPIType). */
#define CMPI_null ((CMPIType)0x00)
#define CMPI_SIMPLE ((CMPIType)0x02)
#define CMPI_boolean ((CMPIType)0x02)
#define CMPI_char16 ((CMPIType)0x03)
#define CMPI_REAL ((CMPIType)0x08)
#define CMPI_real32 ((CMPIType)0x08)
#define CMPI_real64 ((CMPIType)0x0C)
#define CMPI_UINT ((CMPIType)0x80)
#define CMPI_uint8 ((CMPIType)0x80)
#define CMPI_uint16 ((CMPIType)0x90)
#define CMPI_uint32 ((CMPIType)0xA0)
#define CMPI_uint64 ((CMPIType)0xB0)
#define CMPI_SINT ((CMPIType)0xC0)
#define CMPI_sint8 ((CMPIType)0xC0)
#define CMPI_sint16 ((CMPIType)0xD0)
#define CMPI_sint32 ((CMPIType)0xE0)
#define CMPI_sint64 ((CMPIType)0xF0)
#define CMPI_INTEGER ((CMPIType)(CMPI_UINT | CMPI_SINT))

#define CMPI_ENC ((CMPIType)0x1000)
#define CMPI_instance ((CMPIType)0x1000)
#define CMPI_ref ((CMPIType)0x1100)
#define CMPI_args ((CMPIType)0x1200)
#define CMPI_class ((CMPIType)0x1300)
#define CMPI_filter ((CMPIType)0x1400)
#define CMPI_enumeration ((CMPIType)0x1500)
#define CMPI_string ((CMPIType)0x1600)
#define CMPI_chars ((CMPIType)0x1700)
#define CMPI_dateTime ((CMPIType)0x1800)
#define CMPI_ptr ((CMPIType)0x1900)
#define CMPI_charsptr ((CMPIType)0x1A00)

#define CMPI_ARRAY ((CMPIType)0x2000)
#define CMPI_SIMPLEA ((CMPIType)(CMPI_ARRAY | CMPI_SIMPLE))
#define CMPI_booleanA ((CMPIType)(CMPI_ARRAY | CMPI_boolean))
#define CMPI_char16A ((CMPIType)(CMPI_ARRAY | CMPI_char16))
#define CMPI_REALA ((CMPIType)(CMPI_ARRAY | CMPI_REAL))
#define CMPI_real32A ((CMPIType)(CMPI_ARRAY | CMPI_real32))
#define CMPI_real64A ((CMPIType)(CMPI_ARRAY | CMPI_real64))
#define CMPI_UINTA ((CMPIType)(CMPI_ARRAY | CMPI_UINT))
#define CMPI_uint8A ((CMPIType)(CMPI_ARRAY | CMPI_uint8))
#define CMPI_uint16A ((CMPIType)(CMPI_ARRAY | CMPI_uint16))
#define CMPI_uint32A ((CMPIType)(CMPI_ARRAY | CMPI_uint32))
#define CMPI_uint64A ((CMPIType)(CMPI_ARRAY | CMPI_uint64))
#define CMPI_SINTA ((CMPIType)(CMPI_ARRAY | CMPI_SINT))
#define CMPI_sint8A ((CMPIType)(CMPI_ARRAY | CMPI_sint8))
#define CMPI_sint16A ((CMPIType)(CMPI_ARRAY | CMPI_sint16))
#define CMPI_sint32A ((CMPIType)(CMPI_ARRAY | CMPI_sint32))
#define CMPI_sint64A ((CMPIType)(CMPI_ARRAY | CMPI_sint64))
#define CMPI_ENCA ((CMPIType)(CMPI_ARRAY | CMPI_ENC))
#define CMPI_instanceA ((CMPIType)(CMPI_ARRAY | CMPI_instance))
#define CMPI_refA ((CMPIType)(CMPI_ARRAY | CMPI_ref))
#define CMPI_argsA ((CMPIType)(CMPI_ARRAY | CMPI_args))
#define CMPI_classA ((CMPIType)(CMPI_ARRAY | CMPI_class))
#define CMPI_filterA ((CMPIType)(CMPI_ARRAY | CMPI_filter))
#define CMPI_enumerationA ((CMPIType)(CMPI_ARRAY | CMPI_enumeration))
#define CMPI_stringA ((CMPIType)(CMPI_ARRAY | CMPI_string))
#define CMPI_charsA ((CMPIType)(CMPI_ARRAY | CMPI_chars))
#define CMPI_dateTimeA ((CMPIType)(CMPI_ARRAY | CMPI_dateTime))
#define CMPI_ptrA ((CMPIType)(CMPI_ARRAY | CMPI_ptr))
#define CMPI_charsptrA ((CMPIType)(CMPI_ARRAY | CMPI_charsptr))

#define CMPI_keyInteger CMPI_sint64
#define CMPI_keyString CMPI_string
#define CMPI_keyBoolean CMPI_boolean
#define CMPI_keyRef CMPI_ref

/* Value states (CMPIValueState), flags. */
#define CMPI_goodValue ((CMPIValueState)0x0000)
#define CMPI_nullValue ((CMPIValueState)0x0100)
#define CMPI_keyValue ((CMPIValueState)0x0200)
#define CMPI_notFound ((CMPIValueState)0x0400)
#define CMPI_badValue ((CMPIValueState)0x8000)

/* Invocation flags: the uint32 under the context entry CMPIInvocationFlags. */
#define CMPI_FLAG_LocalOnly 1U
#define CMPI_FLAG_DeepInheritance 2U
#define CMPI_FLAG_IncludeQualifiers 4U
#define CMPI_FLAG_IncludeClassOrigin 8U

/* Names of context entries. */
#define CMPIInvocationFlags "CMPIInvocationFlags"
#define CMPIPrincipal "CMPIPrincipal"
#define CMPIRole "CMPIRole"
#define CMPIInitNameSpace "CMPIInitNameSpace"
#define CMPIAcceptLanguage "CMPIAcceptLanguage"
#define CMPIContentLanguage "CMPIContentLanguage"

/* Broker capabilities (CMPIBrokerFT.brokerCapabilities), bits that include what they stand on. */
#define CMPI_MB_BasicRead 0x00000001U
#define CMPI_MB_BasicWrite 0x00000003U
#define CMPI_MB_InstanceManipulation 0x00000007U
#define CMPI_MB_AssociationTraversal 0x00000009U
#define CMPI_MB_QueryExecution 0x00000011U
#define CMPI_MB_QueryNormalization 0x00000031U
#define CMPI_MB_BasicQualifierSupport 0x00000047U
#define CMPI_MB_Indications 0x00000081U
#define CMPI_MB_OSEncapsulationSupport 0x00000100U
#define CMPI_MB_MemEnhancements 0x00004000U
#define CMPI_MB_Extended_Error 0x00008000U

/** Result of an operation: the CIM status codes of DSP0200, and CMPI's own from 50 on. */
typedef enum _CMPIrc {
    CMPI_RC_OK = 0,
    CMPI_RC_ERR_FAILED = 1,
    CMPI_RC_ERR_ACCESS_DENIED = 2,
    CMPI_RC_ERR_INVALID_NAMESPACE = 3,
    CMPI_RC_ERR_INVALID_PARAMETER = 4,
    CMPI_RC_ERR_INVALID_CLASS = 5,
    CMPI_RC_ERR_NOT_FOUND = 6,
    CMPI_RC_ERR_NOT_SUPPORTED = 7,
    CMPI_RC_ERR_CLASS_HAS_CHILDREN = 8,
    CMPI_RC_ERR_CLASS_HAS_INSTANCES = 9,
    CMPI_RC_ERR_INVALID_SUPERCLASS = 10,
    CMPI_RC_ERR_ALREADY_EXISTS = 11,
    CMPI_RC_ERR_NO_SUCH_PROPERTY = 12,
    CMPI_RC_ERR_TYPE_MISMATCH = 13,
    CMPI_RC_ERR_QUERY_LANGUAGE_NOT_SUPPORTED = 14,
    CMPI_RC_ERR_INVALID_QUERY = 15,
    CMPI_RC_ERR_METHOD_NOT_AVAILABLE = 16,
    CMPI_RC_ERR_METHOD_NOT_FOUND = 17,
    CMPI_RC_NO_MORE_ELEMENTS = 18,
    CMPI_RC_ERR_SERVER_LIMITS_EXCEEDED = 27,
    CMPI_RC_ERR_QUERY_FEATURE_NOT_SUPPORTED = 29,
    CMPI_RC_DO_NOT_UNLOAD = 50,
    CMPI_RC_NEVER_UNLOAD = 51,
    CMPI_RC_ERR_INVALID_HANDLE = 60,
    CMPI_RC_ERR_INVALID_DATA_TYPE = 61,
    CMPI_RC_ERR_NOT_IN_CODEPAGE = 62,
    CMPI_RC_ERROR_SYSTEM = 100,
    CMPI_RC_ERROR = 200
} CMPIrc;

/** What an operation came to; `msg` may be null and belongs to the broker. */
typedef struct _CMPIStatus {
    CMPIrc rc;
    CMPIString* msg;
} CMPIStatus;

/** Comparison of a CMPIPredicate. */
typedef enum _CMPIPredOp {
    CMPI_PredOp_Equals = 1,
    CMPI_PredOp_NotEquals = 2,
    CMPI_PredOp_LessThan = 3,
    CMPI_PredOp_GreaterThanOrEquals = 4,
    CMPI_PredOp_GreaterThan = 5,
    CMPI_PredOp_LessThanOrEquals = 6,
    CMPI_PredOp_Isa = 7,
    CMPI_PredOp_NotIsa = 8,
    CMPI_PredOp_Like = 9,
    CMPI_PredOp_NotLike = 10
} CMPIPredOp;

/** Severity of a line given to CMPIBrokerEncFT.logMessage. */
typedef enum _CMPISeverity {
    CMPI_SEV_ERROR = 1,
    CMPI_SEV_INFO = 2,
    CMPI_SEV_WARNING = 3,
    CMPI_DEV_DEBUG = 4
} CMPISeverity;

/** Detail of a line given to CMPIBrokerEncFT.trace. */
typedef enum _CMPILevel { CMPI_LEV_INFO = 1, CMPI_LEV_WARNING = 2, CMPI_LEV_VERBOSE = 3 } CMPILevel;

/** CIM_Error.ErrorType. */
typedef enum _CMPIErrorType {
    UnknownErrorType = 0,
    OtherErrorType = 1,
    CommunicationsErrorType = 2,
    QualityOfServiceErrorType = 3,
    SoftwareErrorType = 4,
    HardwareErrorType = 5,
    EnvironmentalErrorType = 6,
    SecurityErrorType = 7,
    OversubscriptionErrorType = 8,
    UnavailableResourceErrorType = 9,
    UnsupportedOperationErrorType = 10
} CMPIErrorType;

/** CIM_Error.PerceivedSeverity. */
typedef enum _CMPIErrorSeverity {
    ErrorSeverityUnknown = 0,
    ErrorSeverityLow = 2,
    ErrorSeverityMedium = 3,
    ErrorSeverityHigh = 4,
    ErrorSeverityFatal = 5
} CMPIErrorSeverity;

/** CIM_Error.ProbableCause: the value map of the CIM schema; a broker passes any of its numbers through. */
typedef enum _CMPIErrorProbableCause {
    ErrorProbCauseUnknown = 0,
    ErrorProbCauseOther = 1,
    ErrorProbCauseLargest = 130
} CMPIErrorProbableCause;

/** CIM_Error.ErrorSourceFormat. */
typedef enum _CMPIErrorSrcFormat {
    CMPIErrorSrcFormatUnknown = 0,
    CMPIErrorSrcFormatOther = 1,
    CMPIErrorSrcFormatCIMObjectPath = 2
} CMPIErrorSrcFormat;

/** Reads the named property of the object behind the second argument. */
typedef CMPIData CMPIAccessor(const char*, void*);

#ifdef __cplusplus
}
#endif

#endif
