#pragma once

#include <ComputeSubjectFK/VRigidTransform.h>
#include <ZEK/Result.h>

#include <cstdint>
#include <exception>
#include <memory>
#include <string>
#include <vector>

namespace ComputeSubject
{

/// Possible joint types.
enum class EJointType : std::uint32_t
{
  Free,        ///< rotation vector, then translation
  Ball,        ///< rotation vector
  HardySpicer, ///< about local z, then about the turned y
  Hinge,       ///< about local z
  Slider,      ///< along local z
  Dummy,
  BadJointType
};

using StateIterator = std::vector< double >::iterator;
using ConstStateIterator = std::vector< double >::const_iterator;

/// How one degree of freedom moves what hangs on its joint: a turn about an axis through `Origin`, and a shift. World.
struct VJointAxis
{
  double Angular[3] = {}, Origin[3] = {}, Linear[3] = {};
};

/// The moving part between two fixed transforms, with its state. Angles in rad, distances in mm.
class IJointFK
{
public:
  virtual ~IJointFK() = default;
  virtual EJointType JointType() const = 0;
  virtual std::size_t DegreesOfFreedom() const = 0;
  virtual const VRigidTransform& PreTransform() const = 0;
  virtual const VRigidTransform& PostTransform() const = 0;
  /// Takes as many numbers as there are degrees of freedom, whatever they are, and moves on behind them.
  virtual void LoadState( ConstStateIterator& io_rState ) = 0;
  /// Writes only the elements that the kind has; the others must be zeros.
  virtual void ComputeTransform( VRigidTransform& o_rTransform ) const = 0;
  /// Brings angles into (-pi, pi] and rotation vectors to a length of at most pi, in place, and moves on.
  virtual void NormaliseState( StateIterator& io_rState ) const = 0;
  virtual std::unique_ptr< IJointFK > Clone() const = 0;
  /// One for each degree of freedom. `i_rFixed` is where the moving part stands in the world.
  virtual void ComputeAxes( const VRigidTransform& i_rFixed, VJointAxis* o_pAxes ) const = 0;
  virtual void CopyState( StateIterator& io_rState ) const = 0;
  /// From now on the state is what stands there, until one is loaded. Belongs to the caller and must stay.
  virtual void ViewState( const double* i_pState ) = 0;
};

/// What a joint is made from.
struct VJointRecord
{
  EJointType m_Type = EJointType::Dummy;
  VRigidTransform m_Pre = VRigidTransform::Identity(), m_Post = VRigidTransform::Identity();
};

/// A tree that cannot be built from what was given.
class VConstructionException : public std::exception
{
public:
  explicit VConstructionException( std::string i_Text, ZEK::IResult i_Code = ZEK::IResult::InvalidArgument )
    : m_Text( std::move( i_Text ) )
    , m_Code( i_Code )
  {
  }
  const char* what() const noexcept override { return m_Text.c_str(); }
  ZEK::IResult Code() const { return m_Code; }

private:
  std::string m_Text;
  ZEK::IResult m_Code;
};

/// Makes joints of one kind. Thread: any.
class IJointFKFactory
{
public:
  virtual ~IJointFKFactory() = default;
  virtual EJointType JointType() const = 0;
  /// Throws `VConstructionException` for a record of another kind, for numbers that are not finite (`InvalidValue`) and
  /// for rotations whose rows are off by more than 1e-6 (`InvalidValue`).
  virtual std::unique_ptr< IJointFK > Create( const VJointRecord& i_rRecord ) const = 0;
};

/// Throws `VConstructionException` (`InvalidType`) for `BadJointType` and numbers beyond.
const IJointFKFactory& FindJointFactory( EJointType i_Type );

} // namespace ComputeSubject
