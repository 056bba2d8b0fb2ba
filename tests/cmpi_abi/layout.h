/* Sizes and offsets of every CMPI 2.0 struct on LP64, checked by the compiler. Included from C and from C++. */
#include <cmpimacs.h>
#include <stddef.h>

#if defined(__cplusplus)
#define ABI_ASSERT(condition, text) static_assert(condition, text)
#else
#define ABI_ASSERT(condition, text) _Static_assert(condition, text)
#endif
#define ABI_SIZE(type, bytes) ABI_ASSERT(sizeof(type) == (bytes), "size of " #type)
#define ABI_OFFSET(type, member, bytes) ABI_ASSERT(offsetof(type, member) == (bytes), "offset of " #type "." #member)

ABI_SIZE(CMPIValuePtr, 16);
ABI_OFFSET(CMPIValuePtr, ptr, 0);
ABI_OFFSET(CMPIValuePtr, length, 8);

ABI_SIZE(CMPIValue, 16);
ABI_OFFSET(CMPIValue, boolean, 0);
ABI_OFFSET(CMPIValue, char16, 0);
ABI_OFFSET(CMPIValue, uint8, 0);
ABI_OFFSET(CMPIValue, uint16, 0);
ABI_OFFSET(CMPIValue, uint32, 0);
ABI_OFFSET(CMPIValue, uint64, 0);
ABI_OFFSET(CMPIValue, sint8, 0);
ABI_OFFSET(CMPIValue, sint16, 0);
ABI_OFFSET(CMPIValue, sint32, 0);
ABI_OFFSET(CMPIValue, sint64, 0);
ABI_OFFSET(CMPIValue, real32, 0);
ABI_OFFSET(CMPIValue, real64, 0);
ABI_OFFSET(CMPIValue, inst, 0);
ABI_OFFSET(CMPIValue, ref, 0);
ABI_OFFSET(CMPIValue, args, 0);
ABI_OFFSET(CMPIValue, filter, 0);
ABI_OFFSET(CMPIValue, Enum, 0);
ABI_OFFSET(CMPIValue, array, 0);
ABI_OFFSET(CMPIValue, string, 0);
ABI_OFFSET(CMPIValue, chars, 0);
ABI_OFFSET(CMPIValue, dateTime, 0);
ABI_OFFSET(CMPIValue, dataPtr, 0);
ABI_OFFSET(CMPIValue, Byte, 0);
ABI_OFFSET(CMPIValue, Short, 0);
ABI_OFFSET(CMPIValue, Int, 0);
ABI_OFFSET(CMPIValue, Long, 0);
ABI_OFFSET(CMPIValue, Float, 0);
ABI_OFFSET(CMPIValue, Double, 0);

ABI_SIZE(CMPIData, 24);
ABI_OFFSET(CMPIData, type, 0);
ABI_OFFSET(CMPIData, state, 2);
ABI_OFFSET(CMPIData, value, 8);

ABI_SIZE(CMPIStatus, 16);
ABI_OFFSET(CMPIStatus, rc, 0);
ABI_OFFSET(CMPIStatus, msg, 8);

ABI_SIZE(CMPIBroker, 40);
ABI_OFFSET(CMPIBroker, hdl, 0);
ABI_OFFSET(CMPIBroker, bft, 8);
ABI_OFFSET(CMPIBroker, eft, 16);
ABI_OFFSET(CMPIBroker, xft, 24);
ABI_OFFSET(CMPIBroker, mft, 32);

ABI_SIZE(CMPIBrokerFT, 184);
ABI_OFFSET(CMPIBrokerFT, brokerCapabilities, 0);
ABI_OFFSET(CMPIBrokerFT, brokerVersion, 4);
ABI_OFFSET(CMPIBrokerFT, brokerName, 8);
ABI_OFFSET(CMPIBrokerFT, prepareAttachThread, 16);
ABI_OFFSET(CMPIBrokerFT, attachThread, 24);
ABI_OFFSET(CMPIBrokerFT, detachThread, 32);
ABI_OFFSET(CMPIBrokerFT, deliverIndication, 40);
ABI_OFFSET(CMPIBrokerFT, enumerateInstanceNames, 48);
ABI_OFFSET(CMPIBrokerFT, getInstance, 56);
ABI_OFFSET(CMPIBrokerFT, createInstance, 64);
ABI_OFFSET(CMPIBrokerFT, modifyInstance, 72);
ABI_OFFSET(CMPIBrokerFT, deleteInstance, 80);
ABI_OFFSET(CMPIBrokerFT, execQuery, 88);
ABI_OFFSET(CMPIBrokerFT, enumerateInstances, 96);
ABI_OFFSET(CMPIBrokerFT, associators, 104);
ABI_OFFSET(CMPIBrokerFT, associatorNames, 112);
ABI_OFFSET(CMPIBrokerFT, references, 120);
ABI_OFFSET(CMPIBrokerFT, referenceNames, 128);
ABI_OFFSET(CMPIBrokerFT, invokeMethod, 136);
ABI_OFFSET(CMPIBrokerFT, setProperty, 144);
ABI_OFFSET(CMPIBrokerFT, getProperty, 152);
ABI_OFFSET(CMPIBrokerFT, enumerateInstancesFiltered, 160);
ABI_OFFSET(CMPIBrokerFT, associatorsFiltered, 168);
ABI_OFFSET(CMPIBrokerFT, referencesFiltered, 176);

ABI_SIZE(CMPIBrokerEncFT, 168);
ABI_OFFSET(CMPIBrokerEncFT, ftVersion, 0);
ABI_OFFSET(CMPIBrokerEncFT, newInstance, 8);
ABI_OFFSET(CMPIBrokerEncFT, newObjectPath, 16);
ABI_OFFSET(CMPIBrokerEncFT, newArgs, 24);
ABI_OFFSET(CMPIBrokerEncFT, newString, 32);
ABI_OFFSET(CMPIBrokerEncFT, newArray, 40);
ABI_OFFSET(CMPIBrokerEncFT, newDateTime, 48);
ABI_OFFSET(CMPIBrokerEncFT, newDateTimeFromBinary, 56);
ABI_OFFSET(CMPIBrokerEncFT, newDateTimeFromChars, 64);
ABI_OFFSET(CMPIBrokerEncFT, newSelectExp, 72);
ABI_OFFSET(CMPIBrokerEncFT, classPathIsA, 80);
ABI_OFFSET(CMPIBrokerEncFT, toString, 88);
ABI_OFFSET(CMPIBrokerEncFT, isOfType, 96);
ABI_OFFSET(CMPIBrokerEncFT, getType, 104);
ABI_OFFSET(CMPIBrokerEncFT, getMessage, 112);
ABI_OFFSET(CMPIBrokerEncFT, logMessage, 120);
ABI_OFFSET(CMPIBrokerEncFT, trace, 128);
ABI_OFFSET(CMPIBrokerEncFT, newCMPIError, 136);
ABI_OFFSET(CMPIBrokerEncFT, openMessageFile, 144);
ABI_OFFSET(CMPIBrokerEncFT, closeMessageFile, 152);
ABI_OFFSET(CMPIBrokerEncFT, getMessage2, 160);

ABI_SIZE(CMPIBrokerExtFT, 168);
ABI_OFFSET(CMPIBrokerExtFT, ftVersion, 0);
ABI_OFFSET(CMPIBrokerExtFT, resolveFileName, 8);
ABI_OFFSET(CMPIBrokerExtFT, newThread, 16);
ABI_OFFSET(CMPIBrokerExtFT, joinThread, 24);
ABI_OFFSET(CMPIBrokerExtFT, exitThread, 32);
ABI_OFFSET(CMPIBrokerExtFT, cancelThread, 40);
ABI_OFFSET(CMPIBrokerExtFT, threadSleep, 48);
ABI_OFFSET(CMPIBrokerExtFT, threadOnce, 56);
ABI_OFFSET(CMPIBrokerExtFT, createThreadKey, 64);
ABI_OFFSET(CMPIBrokerExtFT, destroyThreadKey, 72);
ABI_OFFSET(CMPIBrokerExtFT, getThreadSpecific, 80);
ABI_OFFSET(CMPIBrokerExtFT, setThreadSpecific, 88);
ABI_OFFSET(CMPIBrokerExtFT, newMutex, 96);
ABI_OFFSET(CMPIBrokerExtFT, destroyMutex, 104);
ABI_OFFSET(CMPIBrokerExtFT, lockMutex, 112);
ABI_OFFSET(CMPIBrokerExtFT, unlockMutex, 120);
ABI_OFFSET(CMPIBrokerExtFT, newCondition, 128);
ABI_OFFSET(CMPIBrokerExtFT, destroyCondition, 136);
ABI_OFFSET(CMPIBrokerExtFT, condWait, 144);
ABI_OFFSET(CMPIBrokerExtFT, timedCondWait, 152);
ABI_OFFSET(CMPIBrokerExtFT, signalCondition, 160);

ABI_SIZE(CMPIBrokerMemFT, 120);
ABI_OFFSET(CMPIBrokerMemFT, ftVersion, 0);
ABI_OFFSET(CMPIBrokerMemFT, mark, 8);
ABI_OFFSET(CMPIBrokerMemFT, release, 16);
ABI_OFFSET(CMPIBrokerMemFT, cmpiMalloc, 24);
ABI_OFFSET(CMPIBrokerMemFT, cmpiCalloc, 32);
ABI_OFFSET(CMPIBrokerMemFT, cmpiRealloc, 40);
ABI_OFFSET(CMPIBrokerMemFT, cmpiStrDup, 48);
ABI_OFFSET(CMPIBrokerMemFT, cmpiFree, 56);
ABI_OFFSET(CMPIBrokerMemFT, freeInstance, 64);
ABI_OFFSET(CMPIBrokerMemFT, freeObjectPath, 72);
ABI_OFFSET(CMPIBrokerMemFT, freeArgs, 80);
ABI_OFFSET(CMPIBrokerMemFT, freeString, 88);
ABI_OFFSET(CMPIBrokerMemFT, freeArray, 96);
ABI_OFFSET(CMPIBrokerMemFT, freeDateTime, 104);
ABI_OFFSET(CMPIBrokerMemFT, freeSelectExp, 112);

ABI_SIZE(CMPIContext, 16);
ABI_OFFSET(CMPIContext, hdl, 0);
ABI_OFFSET(CMPIContext, ft, 8);

ABI_SIZE(CMPIContextFT, 56);
ABI_OFFSET(CMPIContextFT, ftVersion, 0);
ABI_OFFSET(CMPIContextFT, release, 8);
ABI_OFFSET(CMPIContextFT, clone, 16);
ABI_OFFSET(CMPIContextFT, getEntry, 24);
ABI_OFFSET(CMPIContextFT, getEntryAt, 32);
ABI_OFFSET(CMPIContextFT, getEntryCount, 40);
ABI_OFFSET(CMPIContextFT, addEntry, 48);

ABI_SIZE(CMPIResult, 16);
ABI_OFFSET(CMPIResult, hdl, 0);
ABI_OFFSET(CMPIResult, ft, 8);

ABI_SIZE(CMPIResultFT, 64);
ABI_OFFSET(CMPIResultFT, ftVersion, 0);
ABI_OFFSET(CMPIResultFT, release, 8);
ABI_OFFSET(CMPIResultFT, clone, 16);
ABI_OFFSET(CMPIResultFT, returnData, 24);
ABI_OFFSET(CMPIResultFT, returnInstance, 32);
ABI_OFFSET(CMPIResultFT, returnObjectPath, 40);
ABI_OFFSET(CMPIResultFT, returnDone, 48);
ABI_OFFSET(CMPIResultFT, returnError, 56);

ABI_SIZE(CMPIString, 16);
ABI_OFFSET(CMPIString, hdl, 0);
ABI_OFFSET(CMPIString, ft, 8);

ABI_SIZE(CMPIStringFT, 32);
ABI_OFFSET(CMPIStringFT, ftVersion, 0);
ABI_OFFSET(CMPIStringFT, release, 8);
ABI_OFFSET(CMPIStringFT, clone, 16);
ABI_OFFSET(CMPIStringFT, getCharPtr, 24);

ABI_SIZE(CMPIArray, 16);
ABI_OFFSET(CMPIArray, hdl, 0);
ABI_OFFSET(CMPIArray, ft, 8);

ABI_SIZE(CMPIArrayFT, 56);
ABI_OFFSET(CMPIArrayFT, ftVersion, 0);
ABI_OFFSET(CMPIArrayFT, release, 8);
ABI_OFFSET(CMPIArrayFT, clone, 16);
ABI_OFFSET(CMPIArrayFT, getSize, 24);
ABI_OFFSET(CMPIArrayFT, getSimpleType, 32);
ABI_OFFSET(CMPIArrayFT, getElementAt, 40);
ABI_OFFSET(CMPIArrayFT, setElementAt, 48);

ABI_SIZE(CMPIEnumeration, 16);
ABI_OFFSET(CMPIEnumeration, hdl, 0);
ABI_OFFSET(CMPIEnumeration, ft, 8);

ABI_SIZE(CMPIEnumerationFT, 48);
ABI_OFFSET(CMPIEnumerationFT, ftVersion, 0);
ABI_OFFSET(CMPIEnumerationFT, release, 8);
ABI_OFFSET(CMPIEnumerationFT, clone, 16);
ABI_OFFSET(CMPIEnumerationFT, getNext, 24);
ABI_OFFSET(CMPIEnumerationFT, hasNext, 32);
ABI_OFFSET(CMPIEnumerationFT, toArray, 40);

ABI_SIZE(CMPIInstance, 16);
ABI_OFFSET(CMPIInstance, hdl, 0);
ABI_OFFSET(CMPIInstance, ft, 8);

ABI_SIZE(CMPIInstanceFT, 88);
ABI_OFFSET(CMPIInstanceFT, ftVersion, 0);
ABI_OFFSET(CMPIInstanceFT, release, 8);
ABI_OFFSET(CMPIInstanceFT, clone, 16);
ABI_OFFSET(CMPIInstanceFT, getProperty, 24);
ABI_OFFSET(CMPIInstanceFT, getPropertyAt, 32);
ABI_OFFSET(CMPIInstanceFT, getPropertyCount, 40);
ABI_OFFSET(CMPIInstanceFT, setProperty, 48);
ABI_OFFSET(CMPIInstanceFT, getObjectPath, 56);
ABI_OFFSET(CMPIInstanceFT, setPropertyFilter, 64);
ABI_OFFSET(CMPIInstanceFT, setObjectPath, 72);
ABI_OFFSET(CMPIInstanceFT, setPropertyWithOrigin, 80);

ABI_SIZE(CMPIObjectPath, 16);
ABI_OFFSET(CMPIObjectPath, hdl, 0);
ABI_OFFSET(CMPIObjectPath, ft, 8);

ABI_SIZE(CMPIObjectPathFT, 160);
ABI_OFFSET(CMPIObjectPathFT, ftVersion, 0);
ABI_OFFSET(CMPIObjectPathFT, release, 8);
ABI_OFFSET(CMPIObjectPathFT, clone, 16);
ABI_OFFSET(CMPIObjectPathFT, setNameSpace, 24);
ABI_OFFSET(CMPIObjectPathFT, getNameSpace, 32);
ABI_OFFSET(CMPIObjectPathFT, setHostname, 40);
ABI_OFFSET(CMPIObjectPathFT, getHostname, 48);
ABI_OFFSET(CMPIObjectPathFT, setClassName, 56);
ABI_OFFSET(CMPIObjectPathFT, getClassName, 64);
ABI_OFFSET(CMPIObjectPathFT, addKey, 72);
ABI_OFFSET(CMPIObjectPathFT, getKey, 80);
ABI_OFFSET(CMPIObjectPathFT, getKeyAt, 88);
ABI_OFFSET(CMPIObjectPathFT, getKeyCount, 96);
ABI_OFFSET(CMPIObjectPathFT, setNameSpaceFromObjectPath, 104);
ABI_OFFSET(CMPIObjectPathFT, setHostAndNameSpaceFromObjectPath, 112);
ABI_OFFSET(CMPIObjectPathFT, getClassQualifier, 120);
ABI_OFFSET(CMPIObjectPathFT, getPropertyQualifier, 128);
ABI_OFFSET(CMPIObjectPathFT, getMethodQualifier, 136);
ABI_OFFSET(CMPIObjectPathFT, getParameterQualifier, 144);
ABI_OFFSET(CMPIObjectPathFT, toString, 152);

ABI_SIZE(CMPIArgs, 16);
ABI_OFFSET(CMPIArgs, hdl, 0);
ABI_OFFSET(CMPIArgs, ft, 8);

ABI_SIZE(CMPIArgsFT, 56);
ABI_OFFSET(CMPIArgsFT, ftVersion, 0);
ABI_OFFSET(CMPIArgsFT, release, 8);
ABI_OFFSET(CMPIArgsFT, clone, 16);
ABI_OFFSET(CMPIArgsFT, addArg, 24);
ABI_OFFSET(CMPIArgsFT, getArg, 32);
ABI_OFFSET(CMPIArgsFT, getArgAt, 40);
ABI_OFFSET(CMPIArgsFT, getArgCount, 48);

ABI_SIZE(CMPIDateTime, 16);
ABI_OFFSET(CMPIDateTime, hdl, 0);
ABI_OFFSET(CMPIDateTime, ft, 8);

ABI_SIZE(CMPIDateTimeFT, 48);
ABI_OFFSET(CMPIDateTimeFT, ftVersion, 0);
ABI_OFFSET(CMPIDateTimeFT, release, 8);
ABI_OFFSET(CMPIDateTimeFT, clone, 16);
ABI_OFFSET(CMPIDateTimeFT, getBinaryFormat, 24);
ABI_OFFSET(CMPIDateTimeFT, getStringFormat, 32);
ABI_OFFSET(CMPIDateTimeFT, isInterval, 40);

ABI_SIZE(CMPISelectExp, 16);
ABI_OFFSET(CMPISelectExp, hdl, 0);
ABI_OFFSET(CMPISelectExp, ft, 8);

ABI_SIZE(CMPISelectExpFT, 64);
ABI_OFFSET(CMPISelectExpFT, ftVersion, 0);
ABI_OFFSET(CMPISelectExpFT, release, 8);
ABI_OFFSET(CMPISelectExpFT, clone, 16);
ABI_OFFSET(CMPISelectExpFT, evaluate, 24);
ABI_OFFSET(CMPISelectExpFT, getString, 32);
ABI_OFFSET(CMPISelectExpFT, getDOC, 40);
ABI_OFFSET(CMPISelectExpFT, getCOD, 48);
ABI_OFFSET(CMPISelectExpFT, evaluateUsingAccessor, 56);

ABI_SIZE(CMPISelectCond, 16);
ABI_OFFSET(CMPISelectCond, hdl, 0);
ABI_OFFSET(CMPISelectCond, ft, 8);

ABI_SIZE(CMPISelectCondFT, 40);
ABI_OFFSET(CMPISelectCondFT, ftVersion, 0);
ABI_OFFSET(CMPISelectCondFT, release, 8);
ABI_OFFSET(CMPISelectCondFT, clone, 16);
ABI_OFFSET(CMPISelectCondFT, getCountAndType, 24);
ABI_OFFSET(CMPISelectCondFT, getSubCondAt, 32);

ABI_SIZE(CMPISubCond, 16);
ABI_OFFSET(CMPISubCond, hdl, 0);
ABI_OFFSET(CMPISubCond, ft, 8);

ABI_SIZE(CMPISubCondFT, 48);
ABI_OFFSET(CMPISubCondFT, ftVersion, 0);
ABI_OFFSET(CMPISubCondFT, release, 8);
ABI_OFFSET(CMPISubCondFT, clone, 16);
ABI_OFFSET(CMPISubCondFT, getCount, 24);
ABI_OFFSET(CMPISubCondFT, getPredicateAt, 32);
ABI_OFFSET(CMPISubCondFT, getPredicate, 40);

ABI_SIZE(CMPIPredicate, 16);
ABI_OFFSET(CMPIPredicate, hdl, 0);
ABI_OFFSET(CMPIPredicate, ft, 8);

ABI_SIZE(CMPIPredicateFT, 40);
ABI_OFFSET(CMPIPredicateFT, ftVersion, 0);
ABI_OFFSET(CMPIPredicateFT, release, 8);
ABI_OFFSET(CMPIPredicateFT, clone, 16);
ABI_OFFSET(CMPIPredicateFT, getData, 24);
ABI_OFFSET(CMPIPredicateFT, evaluateUsingAccessor, 32);

ABI_SIZE(CMPIError, 16);
ABI_OFFSET(CMPIError, hdl, 0);
ABI_OFFSET(CMPIError, ft, 8);

ABI_SIZE(CMPIErrorFT, 216);
ABI_OFFSET(CMPIErrorFT, ftVersion, 0);
ABI_OFFSET(CMPIErrorFT, release, 8);
ABI_OFFSET(CMPIErrorFT, clone, 16);
ABI_OFFSET(CMPIErrorFT, getErrorType, 24);
ABI_OFFSET(CMPIErrorFT, getOtherErrorType, 32);
ABI_OFFSET(CMPIErrorFT, getOwningEntity, 40);
ABI_OFFSET(CMPIErrorFT, getMessageID, 48);
ABI_OFFSET(CMPIErrorFT, getMessage, 56);
ABI_OFFSET(CMPIErrorFT, getPerceivedSeverity, 64);
ABI_OFFSET(CMPIErrorFT, getProbableCause, 72);
ABI_OFFSET(CMPIErrorFT, getProbableCauseDescription, 80);
ABI_OFFSET(CMPIErrorFT, getRecommendedActions, 88);
ABI_OFFSET(CMPIErrorFT, getErrorSource, 96);
ABI_OFFSET(CMPIErrorFT, getErrorSourceFormat, 104);
ABI_OFFSET(CMPIErrorFT, getOtherErrorSourceFormat, 112);
ABI_OFFSET(CMPIErrorFT, getCIMStatusCode, 120);
ABI_OFFSET(CMPIErrorFT, getCIMStatusCodeDescription, 128);
ABI_OFFSET(CMPIErrorFT, getMessageArguments, 136);
ABI_OFFSET(CMPIErrorFT, setErrorType, 144);
ABI_OFFSET(CMPIErrorFT, setOtherErrorType, 152);
ABI_OFFSET(CMPIErrorFT, setProbableCauseDescription, 160);
ABI_OFFSET(CMPIErrorFT, setRecommendedActions, 168);
ABI_OFFSET(CMPIErrorFT, setErrorSource, 176);
ABI_OFFSET(CMPIErrorFT, setErrorSourceFormat, 184);
ABI_OFFSET(CMPIErrorFT, setOtherErrorSourceFormat, 192);
ABI_OFFSET(CMPIErrorFT, setCIMStatusCodeDescription, 200);
ABI_OFFSET(CMPIErrorFT, setMessageArguments, 208);

ABI_SIZE(CMPIInstanceMI, 16);
ABI_OFFSET(CMPIInstanceMI, hdl, 0);
ABI_OFFSET(CMPIInstanceMI, ft, 8);

ABI_SIZE(CMPIInstanceMIFT, 80);
ABI_OFFSET(CMPIInstanceMIFT, ftVersion, 0);
ABI_OFFSET(CMPIInstanceMIFT, miVersion, 4);
ABI_OFFSET(CMPIInstanceMIFT, miName, 8);
ABI_OFFSET(CMPIInstanceMIFT, cleanup, 16);
ABI_OFFSET(CMPIInstanceMIFT, enumerateInstanceNames, 24);
ABI_OFFSET(CMPIInstanceMIFT, enumerateInstances, 32);
ABI_OFFSET(CMPIInstanceMIFT, getInstance, 40);
ABI_OFFSET(CMPIInstanceMIFT, createInstance, 48);
ABI_OFFSET(CMPIInstanceMIFT, modifyInstance, 56);
ABI_OFFSET(CMPIInstanceMIFT, deleteInstance, 64);
ABI_OFFSET(CMPIInstanceMIFT, execQuery, 72);

ABI_SIZE(CMPIAssociationMI, 16);
ABI_OFFSET(CMPIAssociationMI, hdl, 0);
ABI_OFFSET(CMPIAssociationMI, ft, 8);

ABI_SIZE(CMPIAssociationMIFT, 56);
ABI_OFFSET(CMPIAssociationMIFT, ftVersion, 0);
ABI_OFFSET(CMPIAssociationMIFT, miVersion, 4);
ABI_OFFSET(CMPIAssociationMIFT, miName, 8);
ABI_OFFSET(CMPIAssociationMIFT, cleanup, 16);
ABI_OFFSET(CMPIAssociationMIFT, associators, 24);
ABI_OFFSET(CMPIAssociationMIFT, associatorNames, 32);
ABI_OFFSET(CMPIAssociationMIFT, references, 40);
ABI_OFFSET(CMPIAssociationMIFT, referenceNames, 48);

ABI_SIZE(CMPIMethodMI, 16);
ABI_OFFSET(CMPIMethodMI, hdl, 0);
ABI_OFFSET(CMPIMethodMI, ft, 8);

ABI_SIZE(CMPIMethodMIFT, 32);
ABI_OFFSET(CMPIMethodMIFT, ftVersion, 0);
ABI_OFFSET(CMPIMethodMIFT, miVersion, 4);
ABI_OFFSET(CMPIMethodMIFT, miName, 8);
ABI_OFFSET(CMPIMethodMIFT, cleanup, 16);
ABI_OFFSET(CMPIMethodMIFT, invokeMethod, 24);

ABI_SIZE(CMPIPropertyMI, 16);
ABI_OFFSET(CMPIPropertyMI, hdl, 0);
ABI_OFFSET(CMPIPropertyMI, ft, 8);

ABI_SIZE(CMPIPropertyMIFT, 48);
ABI_OFFSET(CMPIPropertyMIFT, ftVersion, 0);
ABI_OFFSET(CMPIPropertyMIFT, miVersion, 4);
ABI_OFFSET(CMPIPropertyMIFT, miName, 8);
ABI_OFFSET(CMPIPropertyMIFT, cleanup, 16);
ABI_OFFSET(CMPIPropertyMIFT, setProperty, 24);
ABI_OFFSET(CMPIPropertyMIFT, getProperty, 32);
ABI_OFFSET(CMPIPropertyMIFT, setPropertyWithOrigin, 40);

ABI_SIZE(CMPIIndicationMI, 16);
ABI_OFFSET(CMPIIndicationMI, hdl, 0);
ABI_OFFSET(CMPIIndicationMI, ft, 8);

ABI_SIZE(CMPIIndicationMIFT, 96);
ABI_OFFSET(CMPIIndicationMIFT, ftVersion, 0);
ABI_OFFSET(CMPIIndicationMIFT, miVersion, 4);
ABI_OFFSET(CMPIIndicationMIFT, miName, 8);
ABI_OFFSET(CMPIIndicationMIFT, cleanup, 16);
ABI_OFFSET(CMPIIndicationMIFT, authorizeFilter, 24);
ABI_OFFSET(CMPIIndicationMIFT, mustPoll, 32);
ABI_OFFSET(CMPIIndicationMIFT, activateFilter, 40);
ABI_OFFSET(CMPIIndicationMIFT, deActivateFilter, 48);
ABI_OFFSET(CMPIIndicationMIFT, enableIndications, 56);
ABI_OFFSET(CMPIIndicationMIFT, disableIndications, 64);
ABI_OFFSET(CMPIIndicationMIFT, authorizeFilterCollection, 72);
ABI_OFFSET(CMPIIndicationMIFT, activateFilterCollection, 80);
ABI_OFFSET(CMPIIndicationMIFT, deActivateFilterCollection, 88);

#define ABI_VALUE(name, number) ABI_ASSERT((name) == (number), "value of " #name)

ABI_SIZE(CMPIBoolean, 1);
ABI_SIZE(CMPIChar16, 2);
ABI_SIZE(CMPIUint8, 1);
ABI_SIZE(CMPIUint16, 2);
ABI_SIZE(CMPIUint32, 4);
ABI_SIZE(CMPIUint64, 8);
ABI_SIZE(CMPISint8, 1);
ABI_SIZE(CMPISint16, 2);
ABI_SIZE(CMPISint32, 4);
ABI_SIZE(CMPISint64, 8);
ABI_SIZE(CMPIReal32, 4);
ABI_SIZE(CMPIReal64, 8);
ABI_SIZE(CMPICount, 4);
ABI_SIZE(CMPIType, 2);
ABI_SIZE(CMPIValueState, 2);
ABI_SIZE(CMPIFlags, 4);
ABI_SIZE(CMPIVersion, 4);
ABI_SIZE(CMPIMsgFileHandle, 8);
ABI_SIZE(CMPIrc, 4);
ABI_SIZE(CMPIPredOp, 4);
ABI_SIZE(CMPISeverity, 4);
ABI_SIZE(CMPILevel, 4);
ABI_SIZE(CMPIErrorType, 4);
ABI_SIZE(CMPIErrorSeverity, 4);
ABI_SIZE(CMPIErrorProbableCause, 4);
ABI_SIZE(CMPIErrorSrcFormat, 4);

ABI_VALUE(CMPI_null, 0x0);
ABI_VALUE(CMPI_SIMPLE, 0x2);
ABI_VALUE(CMPI_boolean, 0x2);
ABI_VALUE(CMPI_char16, 0x3);
ABI_VALUE(CMPI_REAL, 0x8);
ABI_VALUE(CMPI_real32, 0x8);
ABI_VALUE(CMPI_real64, 0xC);
ABI_VALUE(CMPI_UINT, 0x80);
ABI_VALUE(CMPI_uint8, 0x80);
ABI_VALUE(CMPI_uint16, 0x90);
ABI_VALUE(CMPI_uint32, 0xA0);
ABI_VALUE(CMPI_uint64, 0xB0);
ABI_VALUE(CMPI_SINT, 0xC0);
ABI_VALUE(CMPI_sint8, 0xC0);
ABI_VALUE(CMPI_sint16, 0xD0);
ABI_VALUE(CMPI_sint32, 0xE0);
ABI_VALUE(CMPI_sint64, 0xF0);
ABI_VALUE(CMPI_ENC, 0x1000);
ABI_VALUE(CMPI_instance, 0x1000);
ABI_VALUE(CMPI_ref, 0x1100);
ABI_VALUE(CMPI_args, 0x1200);
ABI_VALUE(CMPI_class, 0x1300);
ABI_VALUE(CMPI_filter, 0x1400);
ABI_VALUE(CMPI_enumeration, 0x1500);
ABI_VALUE(CMPI_string, 0x1600);
ABI_VALUE(CMPI_chars, 0x1700);
ABI_VALUE(CMPI_dateTime, 0x1800);
ABI_VALUE(CMPI_ptr, 0x1900);
ABI_VALUE(CMPI_charsptr, 0x1A00);
ABI_VALUE(CMPI_ARRAY, 0x2000);
ABI_VALUE(CMPI_stringA, 0x3600);
ABI_VALUE(CMPI_uint16A, 0x2090);
ABI_VALUE(CMPI_booleanA, 0x2002);
ABI_VALUE(CMPI_instanceA, 0x3000);
ABI_VALUE(CMPI_keyInteger, 0xF0);
ABI_VALUE(CMPI_keyString, 0x1600);
ABI_VALUE(CMPI_keyBoolean, 0x2);
ABI_VALUE(CMPI_keyRef, 0x1100);
ABI_VALUE(CMPI_goodValue, 0x0);
ABI_VALUE(CMPI_nullValue, 0x100);
ABI_VALUE(CMPI_keyValue, 0x200);
ABI_VALUE(CMPI_notFound, 0x400);
ABI_VALUE(CMPI_badValue, 0x8000);
ABI_VALUE(CMPI_RC_OK, 0);
ABI_VALUE(CMPI_RC_ERR_FAILED, 1);
ABI_VALUE(CMPI_RC_ERR_ACCESS_DENIED, 2);
ABI_VALUE(CMPI_RC_ERR_INVALID_NAMESPACE, 3);
ABI_VALUE(CMPI_RC_ERR_INVALID_PARAMETER, 4);
ABI_VALUE(CMPI_RC_ERR_INVALID_CLASS, 5);
ABI_VALUE(CMPI_RC_ERR_NOT_FOUND, 6);
ABI_VALUE(CMPI_RC_ERR_NOT_SUPPORTED, 7);
ABI_VALUE(CMPI_RC_ERR_CLASS_HAS_CHILDREN, 8);
ABI_VALUE(CMPI_RC_ERR_CLASS_HAS_INSTANCES, 9);
ABI_VALUE(CMPI_RC_ERR_INVALID_SUPERCLASS, 10);
ABI_VALUE(CMPI_RC_ERR_ALREADY_EXISTS, 11);
ABI_VALUE(CMPI_RC_ERR_NO_SUCH_PROPERTY, 12);
ABI_VALUE(CMPI_RC_ERR_TYPE_MISMATCH, 13);
ABI_VALUE(CMPI_RC_ERR_QUERY_LANGUAGE_NOT_SUPPORTED, 14);
ABI_VALUE(CMPI_RC_ERR_INVALID_QUERY, 15);
ABI_VALUE(CMPI_RC_ERR_METHOD_NOT_AVAILABLE, 16);
ABI_VALUE(CMPI_RC_ERR_METHOD_NOT_FOUND, 17);
ABI_VALUE(CMPI_RC_NO_MORE_ELEMENTS, 18);
ABI_VALUE(CMPI_RC_ERR_SERVER_LIMITS_EXCEEDED, 27);
ABI_VALUE(CMPI_RC_ERR_QUERY_FEATURE_NOT_SUPPORTED, 29);
ABI_VALUE(CMPI_RC_DO_NOT_UNLOAD, 50);
ABI_VALUE(CMPI_RC_NEVER_UNLOAD, 51);
ABI_VALUE(CMPI_RC_ERR_INVALID_HANDLE, 60);
ABI_VALUE(CMPI_RC_ERR_INVALID_DATA_TYPE, 61);
ABI_VALUE(CMPI_RC_ERR_NOT_IN_CODEPAGE, 62);
ABI_VALUE(CMPI_RC_ERROR_SYSTEM, 100);
ABI_VALUE(CMPI_RC_ERROR, 200);
ABI_VALUE(CMPI_LEV_INFO, 1);
ABI_VALUE(CMPI_LEV_WARNING, 2);
ABI_VALUE(CMPI_LEV_VERBOSE, 3);
ABI_VALUE(CMPI_SEV_ERROR, 1);
ABI_VALUE(CMPI_SEV_INFO, 2);
ABI_VALUE(CMPI_SEV_WARNING, 3);
ABI_VALUE(CMPI_DEV_DEBUG, 4);
ABI_VALUE(CMPI_MB_BasicRead, 0x1U);
ABI_VALUE(CMPI_MB_BasicWrite, 0x3U);
ABI_VALUE(CMPI_MB_InstanceManipulation, 0x7U);
ABI_VALUE(CMPI_MB_AssociationTraversal, 0x9U);
ABI_VALUE(CMPI_MB_QueryExecution, 0x11U);
ABI_VALUE(CMPI_MB_QueryNormalization, 0x31U);
ABI_VALUE(CMPI_MB_BasicQualifierSupport, 0x47U);
ABI_VALUE(CMPI_MB_Indications, 0x81U);
ABI_VALUE(CMPI_MB_OSEncapsulationSupport, 0x100U);
ABI_VALUE(CMPI_MB_MemEnhancements, 0x4000U);
ABI_VALUE(CMPI_MB_Extended_Error, 0x8000U);
ABI_VALUE(CMPI_FLAG_LocalOnly, 1U);
ABI_VALUE(CMPI_FLAG_DeepInheritance, 2U);
ABI_VALUE(CMPI_FLAG_IncludeQualifiers, 4U);
ABI_VALUE(CMPI_FLAG_IncludeClassOrigin, 8U);
