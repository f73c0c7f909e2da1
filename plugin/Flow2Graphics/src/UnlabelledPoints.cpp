#include <Flow2Graphics/UnlabelledPoints.h>

#include <CoreMoxelTypes/Reconstruction.h>

#include <algorithm>

namespace Flow2Graphics
{

bool VUnlabelledPoints::ResolveIndex( std::uint32_t i_Index, ZEK::VSelectionItem& o_rItem, std::string& o_rLabel ) const
{
  const auto* const pSet = ZEK::FlowPayload< CoreMoxelTypes::VReconstructionSet >( Set.Get() );
  if ( !pSet || i_Index >= Points.size() )
  {
    return false;
  }
  o_rItem = { ZEK::ESelectReconstruction, {}, 0, Reconstruction[i_Index] };
  o_rLabel = "Reconstruction " + std::to_string( pSet->Items[Reconstruction[i_Index]].Id );
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

} // namespace Flow2Graphics
