#include "VWornMesh.h"

#include <HarrowPluginInterface/MeshMath.h>

#include <atomic>
#include <cmath>

namespace MoxelGraphics
{
namespace
{
using namespace HarrowPluginInterface;

std::uint64_t NextSerial()
{
  static std::atomic< std::uint64_t > Last{ 0 };
  return ++Last;
}

/// The stretch of a list that is a record's, as far as the list goes.
template < typename TValue >
std::span< const TValue > Stretch( const std::vector< TValue >& i_rList, const VSubjectRange& i_rRange )
{
  const std::size_t First = std::min< std::size_t >( i_rRange.First, i_rList.size() );
  return std::span( i_rList ).subspan( First, std::min< std::size_t >( i_rRange.Count, i_rList.size() - First ) );
}
} // namespace

void VWornMesh::SetMesh( std::shared_ptr< VSkinMesh > i_pMesh, const VSubjectGroup& i_rGroup )
{
  m_pMesh = std::move( i_pMesh );
  m_PoseGeneration = 0;
  m_MovedSerial = 0;
  m_bMatched = false;
  m_Bones.clear();
  m_Matrices.clear();
  if ( !m_pMesh )
  {
    return;
  }
  const VSubjectRecord& rRecord = i_rGroup.Records[m_Record];
  const VMeshScene& rMesh = m_pMesh->Mesh();
  m_Scale = rMesh.MillimetresPerUnit * static_cast< double >( rRecord.Mesh.Scale );
  if ( !rRecord.Mesh.Bones.empty() )
  {
    m_Way = EWay::ByMeshBones;
    m_Bones = MapBonesByIndex( rMesh, m_Scale );
  }
  else if ( rRecord.Mesh.bByRoot )
  {
    m_Way = rMesh.Animations.empty() ? EWay::Rigid : EWay::ByAnimation;
  }
  else
  {
    m_Way = EWay::BySubject;
    m_Bones = MapBonesByName( rMesh, Stretch( i_rGroup.BoneNames, rRecord.Bones ), m_Scale );
  }
  m_bMatched = rRecord.Mesh.bByRoot || !m_Bones.empty();
}

VWornMesh::EState VWornMesh::Pose( const VSubjectGroup& i_rGroup )
{
  // Poses by bone of the mesh may come later than it.
  if ( m_pMesh && m_Way != EWay::ByMeshBones && m_PoseGeneration != i_rGroup.PoseGeneration &&
       !i_rGroup.Records[m_Record].Mesh.Bones.empty() )
  {
    SetMesh( m_pMesh, i_rGroup );
  }
  if ( !m_pMesh || !m_bMatched )
  {
    return m_pMesh ? EState::Unmatched : EState::Waiting;
  }
  if ( m_PoseGeneration != i_rGroup.PoseGeneration )
  {
    m_PoseGeneration = i_rGroup.PoseGeneration;
    m_bPosed = std::isfinite( m_Scale ) && m_Scale > 0 && PoseNow( i_rGroup, i_rGroup.Records[m_Record] );
    m_Serial = NextSerial();
  }
  return m_bPosed ? EState::Posed : EState::Unposed;
}

bool VWornMesh::PoseNow( const VSubjectGroup& i_rGroup, const VSubjectRecord& i_rRecord )
{
  switch ( m_Way )
  {
  case EWay::ByMeshBones:
    return PoseSkin( m_Bones, i_rRecord.Mesh.Bones, {}, m_Matrices );
  case EWay::BySubject:
    return PoseSkin( m_Bones, Stretch( i_rGroup.Poses, i_rRecord.Bones ), Stretch( i_rGroup.Health, i_rRecord.Bones ),
                     m_Matrices );
  case EWay::ByAnimation:
    if ( Stand( i_rRecord ) )
    {
      Animate( i_rRecord );
      return true;
    }
    return false;
  default:
    return Stand( i_rRecord );
  }
}

bool VWornMesh::Stand( const VSubjectRecord& i_rRecord )
{
  QMatrix4x4 Model;
  float Check = 0;
  for ( int Row = 0; Row < 3; ++Row )
  {
    for ( int Column = 0; Column < 4; ++Column )
    {
      const float Value = i_rRecord.Root[static_cast< std::size_t >( 4 * Row + Column )];
      Model( Row, Column ) = Column < 3 ? Value * static_cast< float >( m_Scale ) : Value;
      Check += Value - Value;
    }
  }
  m_Model = Model;
  return Check == 0;
}

void VWornMesh::Animate( const VSubjectRecord& i_rRecord )
{
  const VMeshScene& rMesh = m_pMesh->Mesh();
  PoseNodes( rMesh, 0, i_rRecord.Mesh.AnimationTime, m_Nodes );
  VMeshTransform Root;
  for ( std::size_t Index = 0; Index < 12; ++Index )
  {
    Root[Index] = static_cast< double >( i_rRecord.Root[Index] ) * ( Index % 4 < 3 ? m_Scale : 1.0 );
  }
  m_Matrices.resize( rMesh.Bones.size() );
  for ( std::size_t Bone = 0; Bone < m_Matrices.size(); ++Bone )
  {
    const VMeshBone& rBone = rMesh.Bones[Bone];
    m_Matrices[Bone] = ToSkinMatrix( Root * m_Nodes[rBone.Node] * rBone.InverseBind );
  }
}

CoreGraphics::VDynamicBuffer* VWornMesh::MovedVertices()
{
  if ( m_MovedSerial == m_Serial && m_Moved.Bind() )
  {
    return &m_Moved;
  }
  m_MovedSerial = 0;
  void* const pVertices = m_Moved.Map( m_pMesh->VertexCount() * sizeof( VSkinVertex ) );
  if ( !pVertices )
  {
    return nullptr;
  }
  m_pMesh->Skin( m_Matrices, static_cast< VSkinVertex* >( pVertices ) );
  if ( !m_Moved.Unmap() )
  {
    return nullptr;
  }
  m_MovedSerial = m_Serial;
  return &m_Moved;
}

} // namespace MoxelGraphics
