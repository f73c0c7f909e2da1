#pragma once

#include <CoreMoxelTypes/FlowTypes.h>
#include <CoreMoxelTypes/Subject.h>
#include <HostFlow/VFlowFramework.h>
#include <HostSources/VRecordingSource.h>

#include <gtest/gtest.h>

namespace HostSources
{

/// Plays a recording and finds items by kind.
class VRecordingPlayer
{
public:
  explicit VRecordingPlayer( VRecording i_Recording )
    : m_Source( std::make_shared< const VRecording >( std::move( i_Recording ) ) )
  {
  }
  void Show( std::int64_t i_Index )
  {
    EXPECT_EQ( m_Source.MakeState( i_Index, m_Maker, m_State ), ZEK::IResult( ZEK::IResult::Ok ) );
  }
  template < typename TFlow >
  ZEK::VFlowItemRef Item() const
  {
    ZEK::VFlowItemRef Found;
    m_State->FindItem( Found, ZEK::FlowTag< TFlow >, ZEK::EFlowTimeMatch::Overlap );
    return Found;
  }
  template < typename TFlow >
  const typename ZEK::FlowValueType< TFlow >::type& Value() const
  {
    static const typename ZEK::FlowValueType< TFlow >::type None{};
    const auto* pValue = ZEK::FlowPayload< typename ZEK::FlowValueType< TFlow >::type >( Item< TFlow >().Get() );
    EXPECT_NE( pValue, nullptr );
    return pValue ? *pValue : None;
  }
  /// The origin of a joint's segment, mm.
  CoreMoxelTypes::D3 Joint( const std::string& i_rName ) const
  {
    const auto& rSegments = Value< CoreMoxelTypes::FlowSubject >().Segments;
    const auto& rPoses = Value< CoreMoxelTypes::FlowSubjectDynamicParameters >().Segments;
    for ( std::size_t Index = 0; Index < rSegments.size() && Index < rPoses.size(); ++Index )
    {
      if ( rSegments[Index].Name == i_rName )
      {
        return { rPoses[Index].T[0], rPoses[Index].T[1], rPoses[Index].T[2] };
      }
    }
    ADD_FAILURE() << i_rName;
    return {};
  }
  void ExpectJoint( const std::string& i_rName, double i_X, double i_Y, double i_Z ) const
  {
    const CoreMoxelTypes::D3 Place = Joint( i_rName );
    EXPECT_NEAR( Place.x, 10 * i_X, 1e-3 ) << i_rName;
    EXPECT_NEAR( Place.y, 10 * i_Y, 1e-3 ) << i_rName;
    EXPECT_NEAR( Place.z, 10 * i_Z, 1e-3 ) << i_rName;
  }

private:
  const VStateMaker m_Maker{ HostFlow::MakeStateFactory(), HostFlow::MakeItemStore(), 2 };
  VRecordingSource m_Source;
  ZEK::VFlowStateRef m_State;
};

} // namespace HostSources
