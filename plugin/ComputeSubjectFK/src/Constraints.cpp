#include <ComputeSubjectFK/IComputeJointConstraints.h>

#include <ComputeSubjectFK/IJointFK.h>

#include <cmath>

namespace ComputeSubject
{

VComputeJointLimits::VComputeJointLimits( std::vector< VLimit > i_Limits )
  : m_Limits( std::move( i_Limits ) )
{
  for ( const VLimit& rLimit : m_Limits )
  {
    if ( !( rLimit.Low <= rLimit.High ) || !std::isfinite( rLimit.Weight ) )
    {
      throw VConstructionException( "A joint's limits are not in order, or their weight is not finite.",
                                    ZEK::IResult::InvalidValue );
    }
  }
}

void VComputeJointLimits::Residual( const std::vector< double >& i_rState, double* o_pResidual ) const
{
  for ( const VLimit& rLimit : m_Limits )
  {
    double Excess = 0;
    if ( rLimit.Degree < i_rState.size() )
    {
      const double Value = i_rState[rLimit.Degree];
      Excess = Value - std::clamp( Value, rLimit.Low, rLimit.High );
    }
    *o_pResidual++ = rLimit.Weight * Excess;
  }
}

void VComputeJointLimits::Derivative( const std::vector< double >& i_rState, double* o_pDerivative ) const
{
  for ( const VLimit& rLimit : m_Limits )
  {
    const bool bOutside = rLimit.Degree < i_rState.size() &&
                          ( i_rState[rLimit.Degree] < rLimit.Low || i_rState[rLimit.Degree] > rLimit.High );
    *o_pDerivative++ = bOutside ? rLimit.Weight : 0;
  }
}

} // namespace ComputeSubject
