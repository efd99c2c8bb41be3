#include "imaging/kernels/kernel_selection.h"

#include <array>
#include <atomic>

#include "hal/platform/environment.h"
#include "imaging/kernels/processor.h"

namespace ZV {

namespace {

bool HasBaseline(const ProcessorAnswers& /*answers*/) {
    return true;
}

struct KernelForm {
    const RowKernels& rows;
    std::int32_t index;
    bool (*isSupported)(const ProcessorAnswers& answers);
};

/// Within an index, the better form further down.
constexpr std::array KernelForms{
    KernelForm{PlainRowKernels, 0, HasBaseline}, KernelForm{SSE2RowKernels, 1, HasSSE2},
    KernelForm{SSSE3RowKernels, 2, HasSSSE3},    KernelForm{AVX2RowKernels, 2, HasAVX2},
    KernelForm{AVX512RowKernels, 2, HasAVX512},
};

// Words that every kernel reads and any thread may write; each form is good for all of them.
std::atomic<const KernelForm*> selectedForm{nullptr};
std::atomic<const KernelForm*> forcedForm{nullptr};

const ProcessorAnswers& GetProcessor() {
    static const ProcessorAnswers answers = AskProcessor();
    return answers;
}

const KernelForm* FindForm(std::string_view name) {
    for (const KernelForm& form : KernelForms) {
        if (name == form.rows.name) return form.isSupported(GetProcessor()) ? &form : nullptr;
    }
    return nullptr;
}

const KernelForm* FindFormOfEnvironment() {
    const char* const name = GetLibraryVariable("ZENTARA_KERNELS");
    return name == nullptr ? nullptr : FindForm(name);
}

const KernelForm* FindBestForm(const ProcessorAnswers& answers) {
    const std::int32_t index = CalculateKernelIndex(CalculateProcessorClass(answers));
    const KernelForm* best = KernelForms.data();
    for (const KernelForm& form : KernelForms) {
        if (form.index == index && form.isSupported(answers)) best = &form;
    }
    return best;
}

const KernelForm& Select() {
    const KernelForm* form = FindFormOfEnvironment();
    if (form == nullptr) form = FindBestForm(GetProcessor());
    selectedForm.store(form, std::memory_order_relaxed);
    return *form;
}

const KernelForm& GetForm() {
    if (const KernelForm* form = forcedForm.load(std::memory_order_relaxed)) return *form;
    if (const KernelForm* form = selectedForm.load(std::memory_order_relaxed)) return *form;
    return Select();
}

}  // namespace

void SelectKernels() {
    (void)Select();  // The form in force is read where it is needed.
}

bool ForceKernels(std::string_view name) {
    const KernelForm* const form = name.empty() ? nullptr : FindForm(name);
    if (form == nullptr && !name.empty()) return false;
    forcedForm.store(form, std::memory_order_relaxed);
    return true;
}

std::int32_t GetKernelIndex() {
    return GetForm().index;
}

const RowKernels& GetRowKernels() {
    return GetForm().rows;
}

const RowKernels* FindRowKernels(std::string_view name) {
    const KernelForm* const form = FindForm(name);
    return form == nullptr ? nullptr : &form->rows;
}

}  // namespace ZV
