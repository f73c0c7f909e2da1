#include "PoseKernel.h"

namespace ComputeSubject
{
namespace
{
struct VProcessor
{
};
} // namespace

void PoseBaseline( const VPoseTree& i_rTree, const double* i_pState, double* o_pResults )
{
  VPoseKernel< VProcessor >::Run( i_rTree, i_pState, o_pResults );
}

} // namespace ComputeSubject
