#include "processes/qrdfilters/simulation/projection.h"

namespace kor::filters::simulation
{

void SetOrbit(double dfAltitude, double dfMinLook, Viewpoint& oView)
{
    constexpr double R = kEarthRadius;
    const double O = R + dfAltitude;
    oView.mdfOrbitRadius = O;
    oView.mdfNearAngle = kPi * 0.5 - dfMinLook - std::acos(O * std::sin(dfMinLook) / R);
    if (dfAltitude == kChordAltitude)
    {
        oView.mdfNearSlant = std::sin(oView.mdfNearAngle) * R / std::sin(dfMinLook);
        const double dfWidth = kSwathWidth / R;
        const double dfFar =
            std::sqrt(R * R + O * O - std::cos(dfWidth + oView.mdfNearAngle) * (2.0 * O * R));
        const double dfSpan =
            std::acos((dfFar * dfFar + O * O - R * R) / (dfFar * 2.0 * O)) - dfMinLook;
        oView.mdfChordAngle = kPi - dfSpan -
                              std::asin(std::sin(dfSpan) * oView.mdfNearSlant /
                                        (std::sin(dfWidth * 0.5) * (R * 2.0)));
    }
}

}  // namespace kor::filters::simulation
