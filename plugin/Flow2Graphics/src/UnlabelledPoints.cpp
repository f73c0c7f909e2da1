#include <Flow2Graphics/LabelledPoints.h>

#include <algorithm>
#include <array>

namespace Flow2Graphics
{
namespace
{
/// For subjects that bring no colours: one calm colour a subject.
constexpr std::array< std::uint32_t, 6 > Palette{ 0xFFE8B45A, 0xFF6FC97F, 0xFF5AA9F2,
                                                  0xFFD78BE0, 0xFF7FD6DC, 0xFFB0B8C4 };
} // namespace

bool VUnlabelledPoints::ResolveIndex( std::uint32_t i_Index, ZEK::VSelectionItem& o_rItem, std::string& o_rLabel ) const
{
  if ( i_Index >= Points.size() )
  {
    return false;
  }
  o_rItem = { ZEK::ESelectReconstruction, {}, 0, Reconstruction[i_Index] };
  o_rLabel = "Reconstruction " + std::to_string( Ids[i_Index] );
  return true;
}

bool VUnlabelledPoints::FindIndex( const ZEK::VSelectionItem& i_rItem, std::uint32_t& o_rIndex ) const
{
  if ( i_rItem.Kind != ZEK::ESelectReconstruction )
  {
    return false;
  }
  const auto It = std::lower_bound( Reconstruction.begin(), Reconstruction.end(), i_rItem.Sub );
  if ( It == Reconstruction.end() || *It != i_rItem.Sub )
  {
    return false;
  }
  o_rIndex = static_cast< std::uint32_t >( It - Reconstruction.begin() );
  return true;
}

bool VUnlabelledPoints::GetPoint( std::uint32_t i_Index, MoxelGraphics::VScenePoint& o_rPoint ) const
{
  if ( i_Index >= Points.size() )
  {
    return false;
  }
  o_rPoint = Points[i_Index];
  return true;
}

void VUnlabelledPoints::Clear()
{
  Points.clear();
  Reconstruction.clear();
  Ids.clear();
  Residuals.clear();
}

bool VLabelledPoints::Add( const CoreMoxelTypes::VReconstructionLabelSet::L& i_rLabel,
                           const MoxelGraphics::VScenePoint& i_rPoint, float i_Residual )
{
  const auto It = std::find_if( Subjects.begin(), Subjects.end(),
                                [&]( const VLabellingSubject& i_rSubject )
                                {
                                  return i_rSubject.pSubject->Id == i_rLabel.SubjectId;
                                } );
  if ( It == Subjects.end() || i_rLabel.MarkerId >= It->pSubject->Markers.size() )
  {
    return false;
  }
  const auto Index = static_cast< std::uint32_t >( It - Subjects.begin() );
  MoxelGraphics::VScenePoint Point = i_rPoint;
  if ( const float Radius = It->pSubject->Markers[i_rLabel.MarkerId].Radius; Radius > 0 )
  {
    Point.Radius = Radius;
  }
  const bool bColours =
      It->pApplicationData && It->pApplicationData->MarkerColours.size() == It->pSubject->Markers.size();
  Points.push_back( Point );
  Colours.push_back( bColours ? It->pApplicationData->MarkerColours[i_rLabel.MarkerId]
                              : Palette[Index % Palette.size()] );
  Residuals.push_back( i_Residual );
  Members.push_back( { Index, i_rLabel.MarkerId } );
  return true;
}

bool VLabelledPoints::ResolveIndex( std::uint32_t i_Index, ZEK::VSelectionItem& o_rItem, std::string& o_rLabel ) const
{
  if ( i_Index >= Members.size() )
  {
    return false;
  }
  const VMember& rMember = Members[i_Index];
  const CoreMoxelTypes::VSubject& rSubject = *Subjects[rMember.Subject].pSubject;
  o_rLabel = rSubject.Name + ":" + rSubject.Markers[rMember.Marker].Name;
  o_rItem = { ZEK::ESelectMarker, o_rLabel, rSubject.Id, rMember.Marker };
  return true;
}

bool VLabelledPoints::FindIndex( const ZEK::VSelectionItem& i_rItem, std::uint32_t& o_rIndex ) const
{
  if ( i_rItem.Kind != ZEK::ESelectMarker )
  {
    return false;
  }
  const auto It = std::find_if( Members.begin(), Members.end(),
                                [&]( const VMember& i_rMember )
                                {
                                  return i_rMember.Marker == i_rItem.Sub &&
                                         Subjects[i_rMember.Subject].pSubject->Id == i_rItem.Object;
                                } );
  o_rIndex = static_cast< std::uint32_t >( It - Members.begin() );
  return It != Members.end();
}

bool VLabelledPoints::GetPoint( std::uint32_t i_Index, MoxelGraphics::VScenePoint& o_rPoint ) const
{
  if ( i_Index >= Points.size() )
  {
    return false;
  }
  o_rPoint = Points[i_Index];
  return true;
}

void VLabelledPoints::ClearPoints()
{
  Points.clear();
  Colours.clear();
  Residuals.clear();
  Members.clear();
}

} // namespace Flow2Graphics
