// krCoreLib: the whole public interface in one include.
#pragma once

#include <krCoreLib/core/KRExport.h>
#include <krCoreLib/core/CKRDebugOutput.h>
#include <krCoreLib/core/CKRSingleton.h>
#include <krCoreLib/core/CKRString.h>

#include <krCoreLib/platform/KRBStr.h>
#include <krCoreLib/platform/KRGuidDef.h>
#include <krCoreLib/platform/KRCmdTarget.h>
#include <krCoreLib/platform/KRMenu.h>
#include <krCoreLib/platform/KRRegistryAPI.h>

#include <krCoreLib/objectmodel/CKRGuid.h>
#include <krCoreLib/objectmodel/CKRObjGuidPtrMap.h>
#include <krCoreLib/objectmodel/CKRObjPtrList.h>
#include <krCoreLib/objectmodel/CKRObjectImpl.h>
#include <krCoreLib/objectmodel/CKRObjectTypeImpl.h>
#include <krCoreLib/objectmodel/CKRTypeRepository.h>
#include <krCoreLib/objectmodel/CKRTypeSystem.h>
#include <krCoreLib/objectmodel/IKRCollection.h>
#include <krCoreLib/objectmodel/IKRObject.h>
#include <krCoreLib/objectmodel/IKRObjectType.h>
#include <krCoreLib/objectmodel/KRObjectTypeMacros.h>

// Serialization: fields, storable objects, archives and documents.
#include <krCoreLib/serialization/CKRArchive.h>
#include <krCoreLib/serialization/CKRBOOL.h>
#include <krCoreLib/serialization/CKRDocument.h>
#include <krCoreLib/serialization/CKRFieldAdaptor.h>
#include <krCoreLib/serialization/CKRFieldDataAction.h>
#include <krCoreLib/serialization/CKRFieldDataAdaptor.h>
#include <krCoreLib/serialization/CKRFieldStream.h>
#include <krCoreLib/serialization/CKRFieldT.h>
#include <krCoreLib/serialization/CKRGroupFieldData.h>
#include <krCoreLib/serialization/CKRObjCollectionFieldT.h>
#include <krCoreLib/serialization/CKRObjFieldT.h>
#include <krCoreLib/serialization/CKRSerialObject.h>
#include <krCoreLib/serialization/CKRSerialObjectTypeImpl.h>
#include <krCoreLib/serialization/CKRTypeManifest.h>
#include <krCoreLib/serialization/IKRField.h>
#include <krCoreLib/serialization/IKRFieldData.h>
#include <krCoreLib/serialization/IKRFieldStream.h>
#include <krCoreLib/serialization/IKRSerializable.h>
#include <krCoreLib/serialization/IKRSerializableAdaptor.h>
#include <krCoreLib/serialization/KRFieldTypes.h>

// Storage back-ends.
#include <krCoreLib/storage/xml/CKRXMLFileArchive.h>
#include <krCoreLib/storage/xml/CKRXMLFileDocument.h>
#include <krCoreLib/storage/xml/CKRXMLFileFieldStream.h>
#include <krCoreLib/storage/xml/CKRXMLFileTypeManifest.h>
#include <krCoreLib/storage/registry/CKRRegistryFieldStream.h>
#include <krCoreLib/storage/registry/CKRRegistrySerializer.h>
#include <krCoreLib/storage/registry/CKRRegistryTypeManifest.h>
#include <krCoreLib/storage/registry/KRRegistryValues.h>
#include <krCoreLib/platform/KRFileChooser.h>

// Application framework.
#include <krCoreLib/framework/CKRGraphNode.h>
#include <krCoreLib/framework/CKRGraphNodeVisitor.h>
#include <krCoreLib/framework/CKRModel.h>
#include <krCoreLib/framework/CKRObservable.h>
#include <krCoreLib/framework/CKRObservation.h>
#include <krCoreLib/framework/CKRObserver.h>
#include <krCoreLib/framework/CKRPreferences.h>
#include <krCoreLib/framework/CKRTool.h>
#include <krCoreLib/framework/CKRToolEvent.h>

// User interface: the document window as a host of tools.
#include <krCoreLib/ui/CKRMDIChildWnd.h>

// Plug-ins: configuration, loading, sockets, commands and menus.
#include <krCoreLib/plugins/CKRPlugin.h>
#include <krCoreLib/plugins/CKRPluginCfg.h>
#include <krCoreLib/plugins/CKRPluginCmd.h>
#include <krCoreLib/plugins/CKRPluginManager.h>
#include <krCoreLib/plugins/CKRPluginSocket.h>
#include <krCoreLib/plugins/IKRPlugin.h>

// Units and engineering values.
#include <krCoreLib/units/CKRColor.h>
#include <krCoreLib/units/CKROptionSet.h>
#include <krCoreLib/units/CKRPrecision.h>
#include <krCoreLib/units/CKRRangedT.h>
#include <krCoreLib/units/CKRScientificData.h>
#include <krCoreLib/units/CKRTokenizer.h>
#include <krCoreLib/units/KRUnitConversion.h>
#include <krCoreLib/units/SKRUnitHelper.h>

// Math.
#include <krCoreLib/math/CKRMathT.h>
#include <krCoreLib/math/CKRMatrix2T.h>
#include <krCoreLib/math/CKRMatrix3T.h>
#include <krCoreLib/math/CKRMatrix4T.h>
#include <krCoreLib/math/CKRMatrixT.h>
#include <krCoreLib/math/CKRPoint2T.h>
#include <krCoreLib/math/CKRPoint3T.h>
#include <krCoreLib/math/CKRPoint4T.h>
#include <krCoreLib/math/CKRPointT.h>
#include <krCoreLib/math/CKRQuaternionT.h>
#include <krCoreLib/math/CKRTupleT.h>
#include <krCoreLib/math/CKRVector2T.h>
#include <krCoreLib/math/CKRVector3T.h>
#include <krCoreLib/math/CKRVector4T.h>
#include <krCoreLib/math/CKRVectorT.h>

// Geometry.
#include <krCoreLib/geometry/CKRBoundT.h>
#include <krCoreLib/geometry/CKRDistanceT.h>
#include <krCoreLib/geometry/CKRLineT.h>
#include <krCoreLib/geometry/CKRPlanarPolygonT.h>
#include <krCoreLib/geometry/CKRPolyLineT.h>
#include <krCoreLib/geometry/CKRPolygonT.h>
#include <krCoreLib/geometry/CKRTriangleT.h>
#include <krCoreLib/geometry/CKRTriangulateEarClipping.h>
#include <krCoreLib/geometry/CKRVertexSequenceT.h>
#include <krCoreLib/geometry/CKRVertexSourceT.h>
#include <krCoreLib/geometry/KRAdaptiveOrient2d.h>
#include <krCoreLib/geometry/KRQuery2.h>
#include <krCoreLib/geometry/KRSweepElements.h>
#include <krCoreLib/geometry/KRSweepPolygon.h>
#include <krCoreLib/geometry/KRSweepSplayTree.h>
#include <krCoreLib/geometry/KRTInteger.h>
#include <krCoreLib/geometry/KRTRational.h>

// System services.
#include <krCoreLib/system/CKRMemMapFile.h>
#include <krCoreLib/system/CKRPathHelper.h>
#include <krCoreLib/system/CKRRegistry.h>
#include <krCoreLib/system/CKRSingleAppInstance.h>
#include <krCoreLib/system/CKRSystem.h>
#include <krCoreLib/system/CKRProgressTaskThread.h>
#include <krCoreLib/system/CKRReaderWriterLock.h>
#include <krCoreLib/system/CKRThread.h>
