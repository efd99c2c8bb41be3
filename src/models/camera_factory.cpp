#include "camera/camera_factory.h"

#include <new>

#include "models/dorix_b1.h"
#include "models/dorix_r1.h"
#include "models/folary.h"
#include "models/metrona.h"
#include "models/pellan_a1.h"
#include "models/pellan_a2.h"
#include "models/pellan_b1.h"
#include "models/solvane_a1.h"
#include "models/solvane_a2.h"
#include "models/solvane_b1.h"
#include "models/solvane_b2.h"
#include "models/solvane_c1.h"
#include "models/solvane_c2.h"
#include "models/solvane_d1.h"
#include "models/solvane_d2.h"
#include "models/solvane_e1.h"
#include "models/solvane_f1.h"
#include "models/solvane_g1.h"
#include "models/solvane_g2.h"
#include "models/solvane_h1.h"
#include "models/solvane_j1.h"
#include "models/solvane_k1.h"
#include "models/tirel_m1.h"
#include "models/tirel_m2.h"
#include "models/unknown.h"

namespace ZV {

namespace {

template <typename Model>
MorvaneFWCamera* Make(const HALCamera& record) {
    return new (std::nothrow) Model(record);
}

struct FactoryRow {
    std::uint32_t model;
    MorvaneFWCamera* (*make)(const HALCamera& record);
};
constexpr FactoryRow Factories[] = {
    {5, Make<SolvaneA1>},  {6, Make<SolvaneA2>},  {7, Make<DorixB1>},      {8, Make<Folary>},
    {9, Make<SolvaneK1>},  {10, Make<DorixR1>},   {12, Make<SolvaneC1>},   {13, Make<SolvaneB1>},
    {14, Make<PellanA1>},  {15, Make<SolvaneD1>}, {16, Make<SolvaneF1>},   {18, Make<SolvaneC2>},
    {19, Make<SolvaneB2>}, {25, Make<PellanB1>},  {26, Make<SolvaneE1>},   {27, Make<PellanA2>},
    {28, Make<SolvaneD2>}, {29, Make<SolvaneG2>}, {30, Make<SolvaneG1>},   {31, Make<TirelM2>},
    {32, Make<TirelM1>},   {33, Make<SolvaneH1>}, {1001, Make<SolvaneJ1>}, {1002, Make<Metrona>},
};

}  // namespace

MorvaneFWCamera* MakeCamera(std::uint32_t model, const HALCamera& record) {
    for (const FactoryRow& row : Factories) {
        if (row.model == model) return row.make(record);
    }
    return Make<Unknown>(record);
}

}  // namespace ZV
