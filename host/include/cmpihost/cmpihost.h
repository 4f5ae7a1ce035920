// cmpihost: an in-process CMPI host for testing and driving CMPI providers.
//
// The host plays the part of a CIM object manager: it implements the broker side of CMPI 2.0
// (the four broker tables and the encapsulated types), loads a provider library with dlopen,
// creates its MIs and calls their operations, and hands everything the provider produced back as
// plain C++ values.
//
// Loading a provider and running an operation
// -------------------------------------------
//
//   #include <cmpihost/cmpihost.h>
//
//   cmpihost::Broker broker;                                   // one per test (or per tool run)
//   cmpihost::ProviderLibrary library("lib/libbluelightprofileprovider.so.1");  // throws LoadError
//
//   cmpihost::InstanceMILoad load;
//   {
//     cmpihost::Request request(broker);                      // the factory may create objects
//     load = cmpihost::createInstanceMI(library, "BlueLightProfileProvider", broker, request);
//   }
//   ASSERT_TRUE(load.ok()) << load.error;                     // missing symbol, NULL MI, version
//
//   cmpihost::ObjectPathValue classPath("root/cimv2", "KESTA_BlueLight");
//   cmpihost::Outcome outcome = cmpihost::enumerateInstances(broker, load.mi, classPath);
//   EXPECT_EQ(outcome.status.rc, CMPI_RC_OK);
//   EXPECT_EQ(outcome.doneCount, 1u);
//   for (const cmpihost::InstanceValue& light : outcome.instances()) {
//     std::cout << light.path() << ": " << *light.find("ElementName") << "\n";
//   }
//   for (const cmpihost::TraceRecord& trace : outcome.traces) std::cout << trace << "\n";
//
//   cmpihost::cleanup(broker, load.mi);                        // before `library` closes
//
// Association operations work the same way with createAssociationMI and associators(),
// associatorNames(), references() and referenceNames(); every optional C-string argument is an
// OptionalText (std::nullopt is passed as NULL) and every property list a PropertyList
// (std::nullopt = NULL list, {} = empty list).
//
// Answering up-calls, recording and faults
// ----------------------------------------
//
//   // Computer systems for the providers' CBEnumInstanceNames / CBEnumInstances up-calls:
//   cmpihost::InstanceValue system;
//   system.set("CreationClassName", "KESTA_ComputerSystem").set("Name", "host1");
//   broker.setUpcallInstances("KESTA_ComputerSystem", {system});
//   // ... or make those up-calls fail:
//   broker.setUpcallFailure("KESTA_ComputerSystem", {CMPI_RC_ERR_ACCESS_DENIED, "no"});
//
//   broker.calls();  broker.traces();  broker.results();   // everything, in order
//   broker.setRecording(false);                            // for benchmarks
//
//   // Make the 2nd newInstance after this point return NULL:
//   broker.armFault(cmpihost::Fault::nullResult(cmpihost::CreatingFunction::NewInstance, 2));
//   // Count the creating calls of a fault-free run to know which k to try:
//   broker.creationCounts()[cmpihost::CreatingFunction::NewInstance];
//
// Working with the CMPI objects directly
// --------------------------------------
//
// A Request is the scope of one operation. While it lives, everything the broker creates on the
// creating thread belongs to it and is freed when it ends; results are copied out as values.
//
//   {
//     cmpihost::Request request(broker);
//     CMPIObjectPath* path = request.objectPath(classPath);
//     CMPIStatus status = load.mi->ft->enumerateInstanceNames(load.mi, request.context(),
//                                                             request.result(), path);
//     std::vector<cmpihost::ResultEvent> results = request.results();
//   }  // every object of the request is freed here
//
// Things to know
// --------------
//  - CMPI_chars values are stored as CMPI_string (getProperty returns a CMPIString).
//  - A CMPIInstance's object path (getObjectPath, and the path of every instance in the
//    results) takes its keys from the broker's key table (Broker::setClassKeys).
//  - setPropertyFilter(list, keys): properties in neither are silently dropped by setProperty;
//    a NULL list means no filter. Names are compared ignoring case.
//  - Calls on objects with a null handle return CMPI_RC_ERR_INVALID_HANDLE; null pointer
//    arguments return CMPI_RC_ERR_INVALID_PARAMETER. Nothing is done in either case.
//  - The request's own context and result survive CMRelease; every other object is freed by it.
//    Objects made while no request is current belong to the Broker until it ends.
//  - Faults of kind NullResult and NullHandle leave *rc untouched; ErrorStatus sets it.
//  - Up-calls of classes with nothing configured return an empty enumeration and CMPI_RC_OK.
//  - A Request ends on the thread that made it; the Broker must outlive its Requests, and a
//    ProviderLibrary the MIs made from it.
#pragma once

#include <cmpihost/broker.h>
#include <cmpihost/convert.h>
#include <cmpihost/driver.h>
#include <cmpihost/faults.h>
#include <cmpihost/provider_library.h>
#include <cmpihost/records.h>
#include <cmpihost/request.h>
#include <cmpihost/status.h>
#include <cmpihost/value.h>
