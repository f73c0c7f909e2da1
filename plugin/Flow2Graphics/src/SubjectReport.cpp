#include "SubjectReport.h"

#include <Flow2Graphics/VFlowRenderSubjects.h>

#include <MoxelGraphics/VRenderSubjectDynamics.h>
#include <MoxelGraphics/VRenderSubjectMarkers.h>

#include <QtCore/QStringList>

namespace Flow2Graphics
{
namespace
{
using MoxelGraphics::ESubjectKind;
using MoxelGraphics::VRenderSubjectDynamics;
using MoxelGraphics::VRenderSubjectMarkers;

struct VReported
{
  EFlowSubjectGroup Group;
  const char* pRecord;
  const char* pName;
  VRenderSubjectDynamics::EGroup Dynamics;
  VRenderSubjectMarkers::EGroup Markers; ///< `GroupCount`: draws none
};

constexpr VReported Groups[] = {
    { EGroupSubject, "LabellingSubject", "subjects", VRenderSubjectDynamics::ESubjects,
      VRenderSubjectMarkers::ESubjects },
    { EGroupSolving, "SolvingSubject", "solved", VRenderSubjectDynamics::ESolved, VRenderSubjectMarkers::ESolved },
    { EGroupRetargeting, "RetargetingSubject", "retargeted", VRenderSubjectDynamics::ERetargeted,
      VRenderSubjectMarkers::GroupCount },
    { EGroupRigidObject, "PropSubject", "rigidObjects", VRenderSubjectDynamics::ERigidObjects,
      VRenderSubjectMarkers::ERigidObjects },
    { EGroupProp, "PropSubject", "props", VRenderSubjectDynamics::EProps, VRenderSubjectMarkers::EProps },
    { EGroupSceneMesh, "SceneMesh", "sceneMeshes", VRenderSubjectDynamics::ESceneMeshes,
      VRenderSubjectMarkers::GroupCount },
};

struct VKindName
{
  ESubjectKind Kind;
  const char* pName;
};

constexpr VKindName MarkerKinds[] = { { MoxelGraphics::ESubjectMarkers, "markers" },
                                      { MoxelGraphics::ESubjectTargets, "targets" },
                                      { MoxelGraphics::ESubjectSticks, "sticks" } };
constexpr VKindName DynamicsKinds[] = { { MoxelGraphics::ESubjectBones, "bones" },
                                        { MoxelGraphics::ESubjectJoints, "joints" },
                                        { MoxelGraphics::ESubjectOrigins, "origins" },
                                        { MoxelGraphics::ESubjectAxes, "axes" },
                                        { MoxelGraphics::ESubjectWires, "clusters" },
                                        { MoxelGraphics::ESubjectCovariances, "covariances" },
                                        { MoxelGraphics::ESubjectMissingMarkers, "missingMarkers" },
                                        { MoxelGraphics::ESubjectSkins, "skins" } };

QVariantMap ReportGroup( VFlowRenderSubjects& i_rSubjects, const VReported& i_rGroup )
{
  QStringList Names;
  for ( const std::string& rName : i_rSubjects.Group( i_rGroup.Group ).Names() )
  {
    Names.push_back( QString::fromStdString( rName ) );
  }
  QVariantMap Report{ { "names", Names } };
  for ( const VKindName& rKind : MarkerKinds )
  {
    Report[rKind.pName] = i_rGroup.Markers != VRenderSubjectMarkers::GroupCount
                              ? i_rSubjects.Markers().Counts( i_rGroup.Markers ).At( rKind.Kind )
                              : 0u;
  }
  for ( const VKindName& rKind : DynamicsKinds )
  {
    Report[rKind.pName] = i_rSubjects.Dynamics().Counts( i_rGroup.Dynamics ).At( rKind.Kind );
  }
  return Report;
}
} // namespace

QVariantMap ReportSubjects( VFlowRenderSubjects& i_rSubjects )
{
  QVariantMap Report;
  for ( const VReported& rGroup : Groups )
  {
    QVariantMap Record = Report[rGroup.pRecord].toMap();
    Record[rGroup.pName] = ReportGroup( i_rSubjects, rGroup );
    Report[rGroup.pRecord] = Record;
  }
  return Report;
}

} // namespace Flow2Graphics
