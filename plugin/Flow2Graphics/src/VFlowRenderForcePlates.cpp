#include <Flow2Graphics/VFlowRenderForcePlates.h>

#include "StateUpAxis.h"

#include <MoxelGraphics/VMoxelScene.h>

#include <cmath>

namespace Flow2Graphics
{
namespace
{
using namespace CoreMoxelTypes;
using Flow2TypesUtils::ETagRequirement;
using MoxelGraphics::VForcePlate;
using MoxelGraphics::VPlateLoad;

constexpr std::uint32_t PlateColour = 0xFF665F58;
constexpr double UsualThickness = 50; // mm
constexpr unsigned FlagShift = 21;

bool MakePlate( const VDevice& i_rDevice, bool i_bYUp, VForcePlate& o_rPlate )
{
  std::array< std::array< double, 3 >, 4 > Corners;
  for ( std::size_t Corner = 0; Corner < 4; ++Corner )
  {
    Corners[Corner] = { i_rDevice.Corners[Corner].x, i_rDevice.Corners[Corner].y, i_rDevice.Corners[Corner].z };
  }
  const double Own = static_cast< double >( i_rDevice.Thickness );
  const double Thickness = Own > 0 && std::isfinite( Own ) ? Own : UsualThickness;
  return MoxelGraphics::VRenderForcePlates::MakeModel( Corners, Thickness, i_bYUp, o_rPlate.Model );
}

/// Place and pose of the surface from the plate's transform.
void Locate( const VForcePlate& i_rPlate, VPlateMembers::VMember& io_rMember )
{
  const QMatrix4x4 Model = QMatrix4x4( i_rPlate.Model.data() ).transposed();
  const QVector3D X = Model.column( 0 ).toVector3D(), Z = Model.column( 2 ).toVector3D();
  const QVector3D Middle = Model.column( 3 ).toVector3D() + 0.5F * Z;
  io_rMember.Point = { Middle.x(), Middle.y(), Middle.z(),
                       0.5F * std::hypot( X.length(), Model.column( 1 ).toVector3D().length() ) };
  const QVector3D Up = Z.normalized(), Along = X.normalized(), Across = QVector3D::crossProduct( Up, Along );
  io_rMember.Pose.Matrix = { Along.x(), Along.y(), Along.z(), 0, Across.x(), Across.y(), Across.z(), 0,
                             Up.x(),    Up.y(),    Up.z(),    0, Middle.x(), Middle.y(), Middle.z(), 1 };
}
} // namespace

bool VPlateMembers::ResolveIndex( std::uint32_t i_Index, ZEK::VSelectionItem& o_rItem, std::string& o_rLabel ) const
{
  if ( i_Index >= Members.size() )
  {
    return false;
  }
  o_rItem = Members[i_Index].Item;
  o_rLabel = Members[i_Index].Label;
  return true;
}

bool VPlateMembers::FindIndex( const ZEK::VSelectionItem& i_rItem, std::uint32_t& o_rIndex ) const
{
  const auto It = std::lower_bound( Members.begin(), Members.end(), i_rItem,
                                    []( const VMember& i_rMember, const ZEK::VSelectionItem& i_rSought )
                                    {
                                      return i_rMember.Item < i_rSought;
                                    } );
  o_rIndex = static_cast< std::uint32_t >( It - Members.begin() );
  return It != Members.end() && It->Item == i_rItem;
}

bool VPlateMembers::GetPoint( std::uint32_t i_Index, MoxelGraphics::VScenePoint& o_rPoint ) const
{
  if ( i_Index >= Members.size() )
  {
    return false;
  }
  o_rPoint = Members[i_Index].Point;
  return true;
}

VFlowRenderForcePlates::VFlowRenderForcePlates( MoxelGraphics::VMoxelScene& i_rScene )
  : VRenderForcePlates( i_rScene )
{
  m_Devices.AddCache< FlowDevice >( ETagRequirement::Required );
  m_Devices.AddCache< FlowDeviceApplicationData >( ETagRequirement::Optional );
  m_Devices.AddCache< FlowDeviceSamples >( ETagRequirement::Optional );
}

void VFlowRenderForcePlates::Update( const ZEK::IFlowState& i_rState )
{
  m_Devices.Update( i_rState, ZEK::EFlowNameDevice, ZEK::EFlowTimeMatch::Overlap, i_rState.GetKey() );
  const bool bYUp = IsYUp( i_rState, m_rScene.YUp() );
  const bool bPlates = m_Devices.NamesChanged() || bYUp != m_bYUp || m_Devices.Changed( ZEK::FlowTag< FlowDevice > ) ||
                       m_Devices.Changed( ZEK::FlowTag< FlowDeviceApplicationData > );
  if ( bPlates )
  {
    Rebuild( bYUp );
  }
  if ( bPlates || m_Devices.Changed( ZEK::FlowTag< FlowDeviceSamples > ) )
  {
    TakeLoads();
  }
  GiveIds();
}

void VFlowRenderForcePlates::Rebuild( bool i_bYUp )
{
  m_bYUp = i_bYUp;
  m_Made.clear();
  m_Members.Members.clear();
  const auto& rDevices = m_Devices.Values< FlowDevice >();
  const auto& rLooks = m_Devices.Values< FlowDeviceApplicationData >();
  for ( std::size_t Slot = 0; Slot < rDevices.size(); ++Slot )
  {
    VForcePlate Plate;
    const VDevice* const pDevice = rDevices[Slot];
    if ( !pDevice || pDevice->Kind != VDevice::ForcePlate || !MakePlate( *pDevice, i_bYUp, Plate ) )
    {
      continue;
    }
    const std::uint32_t Own = rLooks[Slot] ? rLooks[Slot]->Colour : 0;
    Plate.Colour = Own != 0 ? Own | 0xFF000000 : PlateColour;
    m_Made.push_back( Plate );
    const std::string& rURN = m_Devices.Names()[Slot];
    VPlateMembers::VMember& rMember = m_Members.Members.emplace_back();
    rMember.Item = { ZEK::ESelectDevice, rURN, 0, 0 };
    rMember.Label = pDevice->Name.empty() ? rURN : pDevice->Name;
    rMember.Slot = Slot;
    Locate( Plate, rMember );
  }
  SetPlates( m_Made );
}

void VFlowRenderForcePlates::TakeLoads()
{
  const auto& rSamples = m_Devices.Values< FlowDeviceSamples >();
  m_MadeLoads.assign( m_Members.Members.size(), {} );
  for ( std::size_t Index = 0; Index < m_MadeLoads.size(); ++Index )
  {
    const VDeviceSamples* const pSamples = rSamples[m_Members.Members[Index].Slot];
    if ( pSamples && !pSamples->Wrench.empty() )
    {
      const auto& rWrench = pSamples->Wrench.front();
      m_MadeLoads[Index] = { { rWrench[0], rWrench[1], rWrench[2] }, { rWrench[6], rWrench[7], rWrench[8] } };
    }
  }
  SetLoads( m_MadeLoads );
}

void VFlowRenderForcePlates::GiveIds()
{
  MoxelGraphics::VSelectionRegistry& rRegistry = m_rScene.Registry();
  const auto Count = static_cast< std::uint32_t >( m_Members.Members.size() );
  const std::uint32_t First = Count != 0 ? rRegistry.AllocateRange( Count, m_Members ) : 0;
  for ( const VPlateMembers::VMember& rMember : m_Members.Members )
  {
    rRegistry.SetPose( rMember.Item, rMember.Pose );
  }
  m_Flags.clear();
  for ( const MoxelGraphics::VSelectionRegistry::VMark& rMark : rRegistry.Marks() )
  {
    std::uint32_t Index = 0;
    if ( !m_Members.FindIndex( rMark.Item, Index ) )
    {
      continue;
    }
    m_Flags.resize( Count, 0 );
    m_Flags[Index] = static_cast< std::uint8_t >( rMark.Flags >> FlagShift );
    // A plate is told by its tag while it is selected or lies under the pointer.
    const VPlateMembers::VMember& rMember = m_Members.Members[Index];
    const std::array< float, 3 > Place{ rMember.Point.X, rMember.Point.Y, rMember.Point.Z };
    m_rScene.AddLabel( static_cast< int >( First + Index ), rMember.Item, Place, Place[m_bYUp ? 1 : 2],
                       ( rMark.Flags & MoxelGraphics::EIdSelected ) == 0,
                       ( rMark.Flags & MoxelGraphics::EIdPrimary ) != 0, rMember.Label );
  }
  SetIds( First, m_Flags );
}

} // namespace Flow2Graphics
