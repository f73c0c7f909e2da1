#pragma once

#include "SkinMapping.h"
#include "VSkinMesh.h"

#include <CoreGraphics/VVertexBuffer.h>

#include <QtGui/QMatrix4x4>

namespace MoxelGraphics
{

/// A mesh as one record wears it: how its bones find their poses, and what they came to.
class VWornMesh
{
public:
  enum class EState : std::uint8_t
  {
    Waiting,   ///< there is no mesh
    Unmatched, ///< it has no bone that the subject has
    Unposed,   ///< the subject stands nowhere
    Posed
  };

  explicit VWornMesh( std::size_t i_Record )
    : m_Record( i_Record )
  {
  }
  std::size_t Record() const { return m_Record; }

  /// Null: none.
  void SetMesh( std::shared_ptr< VSkinMesh > i_pMesh, const VSubjectGroup& i_rGroup );
  VSkinMesh* Mesh() const { return m_pMesh.get(); }

  /// Brings the matrices up to the group's poses.
  EState Pose( const VSubjectGroup& i_rGroup );
  /// The whole mesh stands at `Model`, and no bone moves.
  bool IsRigid() const { return m_Way == EWay::Rigid; }
  const QMatrix4x4& Model() const { return m_Model; }
  std::span< const VSkinMatrix > Matrices() const { return m_Matrices; }
  /// Never the same for two sets of matrices in this process.
  std::uint64_t Serial() const { return m_Serial; }
  /// The vertices, moved here; null when there is no room for them.
  CoreGraphics::VDynamicBuffer* MovedVertices();

private:
  enum class EWay : std::uint8_t
  {
    Rigid,
    ByAnimation,
    ByMeshBones,
    BySubject
  };

  bool PoseNow( const VSubjectGroup& i_rGroup, const VSubjectRecord& i_rRecord );
  bool Stand( const VSubjectRecord& i_rRecord );
  void Animate( const VSubjectRecord& i_rRecord );

  std::size_t m_Record;
  std::shared_ptr< VSkinMesh > m_pMesh;
  EWay m_Way = EWay::Rigid;
  bool m_bMatched = false, m_bPosed = false;
  double m_Scale = 1; ///< mm of the world for a unit of the mesh
  std::vector< VSkinBone > m_Bones;
  std::vector< HarrowPluginInterface::VMeshTransform > m_Nodes;
  std::vector< VSkinMatrix > m_Matrices;
  QMatrix4x4 m_Model;
  std::uint64_t m_PoseGeneration = 0;
  std::uint64_t m_Serial = 0;
  std::uint64_t m_MovedSerial = 0; ///< of what the buffer holds
  CoreGraphics::VDynamicBuffer m_Moved;
};

} // namespace MoxelGraphics
