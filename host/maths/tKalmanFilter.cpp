#include "maths/tKalmanFilter.h"

namespace dravikHost {

tCovariance disturbance(double frequencyNoisePpb, double wanderPpb, double seconds)
{
    const double white = frequencyNoisePpb * frequencyNoisePpb;
    const double walk = wanderPpb * wanderPpb;
    return {white * seconds + walk * seconds * seconds * seconds / 3, walk * seconds * seconds / 2,
            walk * seconds};
}

void tKalmanFilter::predict(double seconds, const tCovariance& added)
{
    const tCovariance p = covariance;
    phase += frequency * seconds;
    covariance = {p.xx + seconds * (2 * p.xy + seconds * p.yy) + added.xx,
                  p.xy + seconds * p.yy + added.xy, p.yy + added.yy};
}

void tKalmanFilter::move(double phaseBy, double frequencyBy, const tCovariance& doubt)
{
    phase += phaseBy;
    frequency += frequencyBy;
    covariance.xx += doubt.xx;
    covariance.xy += doubt.xy;
    covariance.yy += doubt.yy;
}

tKalmanFilter::tGains tKalmanFilter::update(double innovation, double noiseVariance)
{
    const tCovariance p = covariance;
    const double sum = p.xx + noiseVariance;
    const tGains gains = {p.xx / sum, p.xy / sum};
    phase += gains.phase * innovation;
    frequency += gains.frequency * innovation;
    covariance = {p.xx - gains.phase * p.xx, p.xy - gains.phase * p.xy,
                  p.yy - gains.frequency * p.xy};
    return gains;
}

} // namespace dravikHost
