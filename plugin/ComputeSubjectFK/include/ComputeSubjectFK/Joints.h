#pragma once

#include <ComputeSubjectFK/IJointFK.h>

namespace ComputeSubject
{

/// What the joints have in common. A copy has a state of its own.
template < typename TJoint, EJointType Type, std::size_t Degrees >
class VJointFK : public IJointFK
{
public:
  static constexpr EJointType Kind = Type;

  explicit VJointFK( const VJointRecord& i_rRecord )
    : m_Pre( i_rRecord.m_Pre )
    , m_Post( i_rRecord.m_Post )
  {
  }
  VJointFK( const VJointFK& i_rOther )
    : IJointFK( i_rOther )
    , m_Pre( i_rOther.m_Pre )
    , m_Post( i_rOther.m_Post )
  {
    std::copy_n( i_rOther.m_pState, Degrees, m_State );
  }
  VJointFK& operator=( const VJointFK& ) = delete;

  EJointType JointType() const final { return Type; }
  std::size_t DegreesOfFreedom() const final { return Degrees; }
  const VRigidTransform& PreTransform() const final { return m_Pre; }
  const VRigidTransform& PostTransform() const final { return m_Post; }
  void LoadState( ConstStateIterator& io_rState ) final
  {
    std::copy_n( io_rState, Degrees, m_State );
    m_pState = m_State;
    io_rState += Degrees;
  }
  void CopyState( StateIterator& io_rState ) const final
  {
    std::copy_n( m_pState, Degrees, io_rState );
    io_rState += Degrees;
  }
  void ViewState( const double* i_pState ) final { m_pState = i_pState; }
  std::unique_ptr< IJointFK > Clone() const final
  {
    return std::make_unique< TJoint >( static_cast< const TJoint& >( *this ) );
  }

protected:
  const double* State() const { return m_pState; }

private:
  VRigidTransform m_Pre, m_Post;
  double m_State[Degrees + 1] = {}; // one more, so that a joint without any has an array
  const double* m_pState = m_State;
};

class VJointFKFree final : public VJointFK< VJointFKFree, EJointType::Free, 6 >
{
public:
  using VJointFK::VJointFK;
  void ComputeTransform( VRigidTransform& o_rTransform ) const override;
  void NormaliseState( StateIterator& io_rState ) const override;
  void ComputeAxes( const VRigidTransform& i_rFixed, VJointAxis* o_pAxes ) const override;
};

class VJointFKBall final : public VJointFK< VJointFKBall, EJointType::Ball, 3 >
{
public:
  using VJointFK::VJointFK;
  void ComputeTransform( VRigidTransform& o_rTransform ) const override;
  void NormaliseState( StateIterator& io_rState ) const override;
  void ComputeAxes( const VRigidTransform& i_rFixed, VJointAxis* o_pAxes ) const override;
};

class VJointFKHardySpicer final : public VJointFK< VJointFKHardySpicer, EJointType::HardySpicer, 2 >
{
public:
  using VJointFK::VJointFK;
  void ComputeTransform( VRigidTransform& o_rTransform ) const override;
  void NormaliseState( StateIterator& io_rState ) const override;
  void ComputeAxes( const VRigidTransform& i_rFixed, VJointAxis* o_pAxes ) const override;
};

class VJointFKHinge final : public VJointFK< VJointFKHinge, EJointType::Hinge, 1 >
{
public:
  using VJointFK::VJointFK;
  void ComputeTransform( VRigidTransform& o_rTransform ) const override;
  void NormaliseState( StateIterator& io_rState ) const override;
  void ComputeAxes( const VRigidTransform& i_rFixed, VJointAxis* o_pAxes ) const override;
};

class VJointFKSlider final : public VJointFK< VJointFKSlider, EJointType::Slider, 1 >
{
public:
  using VJointFK::VJointFK;
  void ComputeTransform( VRigidTransform& o_rTransform ) const override;
  void NormaliseState( StateIterator& io_rState ) const override;
  void ComputeAxes( const VRigidTransform& i_rFixed, VJointAxis* o_pAxes ) const override;
};

class VJointFKDummy final : public VJointFK< VJointFKDummy, EJointType::Dummy, 0 >
{
public:
  using VJointFK::VJointFK;
  void ComputeTransform( VRigidTransform& o_rTransform ) const override;
  void NormaliseState( StateIterator& io_rState ) const override;
  void ComputeAxes( const VRigidTransform& i_rFixed, VJointAxis* o_pAxes ) const override;
};

/// Throws `VConstructionException` unless a joint of kind `i_Type` can be made from the record.
void CheckJointRecord( const VJointRecord& i_rRecord, EJointType i_Type );

template < class TJoint >
class VJointFKFactory final : public IJointFKFactory
{
public:
  EJointType JointType() const override { return TJoint::Kind; }
  std::unique_ptr< IJointFK > Create( const VJointRecord& i_rRecord ) const override
  {
    CheckJointRecord( i_rRecord, TJoint::Kind );
    return std::make_unique< TJoint >( i_rRecord );
  }
};

} // namespace ComputeSubject
