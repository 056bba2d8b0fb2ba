/**
 * @file
 * CMPI 2.0 (The Open Group, C061): convenience macros.
 *
 * Each is one call through a function table. `rc` is the trailing `CMPIStatus *`, which may be null. Macros that take
 * a value cast it to `const CMPIValue *`: pass the address of a variable of the type's member, or, for CMPI_chars,
 * the characters themselves.
 */
#ifndef CMPI_CMPIMACS_H
#define CMPI_CMPIMACS_H

#include "cmpift.h"

/* A value argument as the function tables want it. */
#define CMPI_VALUE_ARGUMENT(v) ((const CMPIValue*)(const void*)(v))

/* Broker: factories. */
#define CMNewInstance(mb, path, rc) ((mb)->eft->newInstance((mb), (path), (rc)))
#define CMNewObjectPath(mb, ns, cls, rc) ((mb)->eft->newObjectPath((mb), (ns), (cls), (rc)))
#define CMNewArgs(mb, rc) ((mb)->eft->newArgs((mb), (rc)))
#define CMNewString(mb, chars, rc) ((mb)->eft->newString((mb), (chars), (rc)))
#define CMNewArray(mb, count, type, rc) ((mb)->eft->newArray((mb), (count), (type), (rc)))
#define CMNewDateTime(mb, rc) ((mb)->eft->newDateTime((mb), (rc)))
#define CMNewDateTimeFromBinary(mb, bin, interval, rc)                                                               \
    ((mb)->eft->newDateTimeFromBinary((mb), (bin), (interval), (rc)))
#define CMNewDateTimeFromChars(mb, chars, rc) ((mb)->eft->newDateTimeFromChars((mb), (chars), (rc)))
#define CMNewSelectExp(mb, query, lang, proj, rc) ((mb)->eft->newSelectExp((mb), (query), (lang), (proj), (rc)))

/* Broker: log and trace. */
#define CMLogMessage(mb, severity, id, text, string) ((mb)->eft->logMessage((mb), (severity), (id), (text), (string)))
#define CMTraceMessage(mb, level, component, text, string)                                                           \
    ((mb)->eft->trace((mb), (level), (component), (text), (string)))

/* Broker: type queries. */
#define CMClassPathIsA(mb, path, cls, rc) ((mb)->eft->classPathIsA((mb), (path), (cls), (rc)))

/* Broker: up-calls. */
#define CBEnumInstances(mb, ctx, path, props, rc) ((mb)->bft->enumerateInstances((mb), (ctx), (path), (props), (rc)))
#define CBEnumInstanceNames(mb, ctx, path, rc) ((mb)->bft->enumerateInstanceNames((mb), (ctx), (path), (rc)))
#define CBGetInstance(mb, ctx, path, props, rc) ((mb)->bft->getInstance((mb), (ctx), (path), (props), (rc)))
#define CBModifyInstance(mb, ctx, path, inst, props) ((mb)->bft->modifyInstance((mb), (ctx), (path), (inst), (props)))
#define CBInvokeMethod(mb, ctx, path, method, in, out, rc)                                                           \
    ((mb)->bft->invokeMethod((mb), (ctx), (path), (method), (in), (out), (rc)))
#define CBDeliverIndication(mb, ctx, ns, inst) ((mb)->bft->deliverIndication((mb), (ctx), (ns), (inst)))
#define CBPrepareAttachThread(mb, ctx) ((mb)->bft->prepareAttachThread((mb), (ctx)))
#define CBAttachThread(mb, ctx) ((mb)->bft->attachThread((mb), (ctx)))
#define CBDetachThread(mb, ctx) ((mb)->bft->detachThread((mb), (ctx)))

/* Any encapsulated object. */
#define CMClone(obj, rc) ((obj)->ft->clone((obj), (rc)))
#define CMRelease(obj) ((obj)->ft->release((obj)))

/* String. */
#define CMGetCharPtr(str) ((str)->ft->getCharPtr((str), NULL))
#define CMGetCharsPtr(str, rc) ((str)->ft->getCharPtr((str), (rc)))

/* Object path. */
#define CMSetNameSpace(op, ns) ((op)->ft->setNameSpace((op), (ns)))
#define CMGetNameSpace(op, rc) ((op)->ft->getNameSpace((op), (rc)))
#define CMSetHostname(op, host) ((op)->ft->setHostname((op), (host)))
#define CMGetHostname(op, rc) ((op)->ft->getHostname((op), (rc)))
#define CMSetClassName(op, cls) ((op)->ft->setClassName((op), (cls)))
#define CMGetClassName(op, rc) ((op)->ft->getClassName((op), (rc)))
#define CMAddKey(op, name, value, type) ((op)->ft->addKey((op), (name), CMPI_VALUE_ARGUMENT(value), (type)))
#define CMGetKey(op, name, rc) ((op)->ft->getKey((op), (name), (rc)))
#define CMGetKeyAt(op, pos, name, rc) ((op)->ft->getKeyAt((op), (pos), (name), (rc)))
#define CMGetKeyCount(op, rc) ((op)->ft->getKeyCount((op), (rc)))
#define CMObjectPathToString(op, rc) ((op)->ft->toString((op), (rc)))

/* Instance. */
#define CMGetProperty(inst, name, rc) ((inst)->ft->getProperty((inst), (name), (rc)))
#define CMGetPropertyAt(inst, pos, name, rc) ((inst)->ft->getPropertyAt((inst), (pos), (name), (rc)))
#define CMGetPropertyCount(inst, rc) ((inst)->ft->getPropertyCount((inst), (rc)))
#define CMSetProperty(inst, name, value, type)                                                                       \
    ((inst)->ft->setProperty((inst), (name), CMPI_VALUE_ARGUMENT(value), (type)))
#define CMGetObjectPath(inst, rc) ((inst)->ft->getObjectPath((inst), (rc)))

/* Method arguments. */
#define CMAddArg(args, name, value, type) ((args)->ft->addArg((args), (name), CMPI_VALUE_ARGUMENT(value), (type)))
#define CMGetArg(args, name, rc) ((args)->ft->getArg((args), (name), (rc)))
#define CMGetArgAt(args, pos, name, rc) ((args)->ft->getArgAt((args), (pos), (name), (rc)))
#define CMGetArgCount(args, rc) ((args)->ft->getArgCount((args), (rc)))

/* Array. */
#define CMGetArrayCount(ar, rc) ((ar)->ft->getSize((ar), (rc)))
#define CMGetArrayType(ar, rc) ((ar)->ft->getSimpleType((ar), (rc)))
#define CMGetArrayElementAt(ar, pos, rc) ((ar)->ft->getElementAt((ar), (pos), (rc)))
#define CMSetArrayElementAt(ar, pos, value, type)                                                                    \
    ((ar)->ft->setElementAt((ar), (pos), CMPI_VALUE_ARGUMENT(value), (type)))

/* Enumeration. */
#define CMHasNext(en, rc) ((en)->ft->hasNext((en), (rc)))
#define CMGetNext(en, rc) ((en)->ft->getNext((en), (rc)))

/* Context. */
#define CMAddContextEntry(ctx, name, value, type)                                                                    \
    ((ctx)->ft->addEntry((ctx), (name), CMPI_VALUE_ARGUMENT(value), (type)))
#define CMGetContextEntry(ctx, name, rc) ((ctx)->ft->getEntry((ctx), (name), (rc)))

/* Result. */
#define CMReturnData(res, value, type) ((res)->ft->returnData((res), CMPI_VALUE_ARGUMENT(value), (type)))
#define CMReturnInstance(res, inst) ((res)->ft->returnInstance((res), (inst)))
#define CMReturnObjectPath(res, path) ((res)->ft->returnObjectPath((res), (path)))
#define CMReturnDone(res) ((res)->ft->returnDone((res)))

/* Statuses. A null `st` is left alone. */
#define CMSetStatus(st, rcp)                                                                                         \
    do {                                                                                                             \
        if ((st) != NULL) {                                                                                          \
            (st)->rc = (rcp);                                                                                        \
            (st)->msg = NULL;                                                                                        \
        }                                                                                                            \
    } while (0)
#define CMSetStatusWithChars(mb, st, rcp, chars)                                                                     \
    do {                                                                                                             \
        if ((st) != NULL) {                                                                                          \
            (st)->rc = (rcp);                                                                                        \
            (st)->msg = CMNewString((mb), (chars), NULL);                                                            \
        }                                                                                                            \
    } while (0)
#define CMReturn(rcp)                                                                                                \
    do {                                                                                                             \
        CMPIStatus cmpiReturnedStatus = {(rcp), NULL};                                                               \
        return cmpiReturnedStatus;                                                                                   \
    } while (0)

#endif
