#pragma once

#include "OsimModel.h"

#include <vector>

namespace HostSources::Osim
{

/// A model as a subject, and its joint states by its coordinates.
///
/// The first segments are the bodies in their order, each where the model has it: without a joint that moves Dummy,
/// with turns alone Ball, else Free. Behind them stand the bones: Dummy segments of a body that begin at its joint and
/// whose x axis points to the joint of a body below, where the model's default pose has it; of a body without one, to
/// the middle of its markers, or without markers to its centre of mass.
class VPoser
{
public:
  /// The model lives longer than this.
  explicit VPoser( const VModel& i_rModel );

  const CoreMoxelTypes::VSubject& Subject() const { return m_Subject; }
  std::size_t StateSize() const { return m_StateSize; }
  /// Appends the state; `io_rValues` has one number a coordinate, those that follow others are set.
  void AppendState( std::vector< double >& io_rValues, std::vector< double >& io_rStates ) const;

private:
  struct VMoved
  {
    VQuaternion Turn{ 1, 0, 0, 0 };
    VVector Shift{}; ///< mm
  };
  VMoved Moved( const VJoint& i_rJoint, const std::vector< double >& i_rValues ) const;
  void Couple( std::vector< double >& io_rValues ) const;
  void AddBodies( const std::vector< double >& i_rDefaults );
  void AddBones( const std::vector< double >& i_rDefaults );
  void AddBone( std::size_t i_Body, const VVector& i_rTo, std::string i_Name );
  /// Where the bone of a body without bodies below ends, mm in its frame, and what is there.
  std::pair< VVector, const char* > EndOf( std::size_t i_Body ) const;
  void AddMarkers();

  const VModel& m_rModel;
  CoreMoxelTypes::VSubject m_Subject;
  std::size_t m_StateSize = 0;
  mutable std::vector< double > m_Arguments;
};

} // namespace HostSources::Osim
