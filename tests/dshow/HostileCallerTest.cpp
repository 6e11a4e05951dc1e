// Every interface method of the filter, its pins, enumerators and class factory called the way a careless
// or hostile host might: null pointers, out-of-range indices and ids, and calls in the wrong state
// (before connection, while streaming, after disconnection). Each must return its documented code.
#include <gtest/gtest.h>

#include <cmath>
#include <functional>

#include "FilterRig.h"

using namespace ulvetta;
using namespace ulvetta::dshow;
using namespace ulvetta::test;

namespace {

// An entry point of the built module.
template <class Function>
Function ModuleEntry(const char* name) {
    std::wstring path = L"Z:";  // build paths are POSIX paths; Wine maps the root to drive Z:
    for (char c : std::string(ULVETTA_AX_PATH)) path += c == '/' ? L'\\' : static_cast<wchar_t>(c);
    static HMODULE module = LoadLibraryW(path.c_str());
    return reinterpret_cast<Function>(reinterpret_cast<void*>(GetProcAddress(module, name)));
}
using GetClassObject = HRESULT(WINAPI*)(REFCLSID, REFIID, void**);
using CanUnloadNow = HRESULT(WINAPI*)();

enum Phase { kFresh, kStreaming, kDisconnected };
const char* const kPhaseNames[] = {"before connection", "while streaming", "after disconnection"};

struct Call {
    Phase phase;
    const char* what;
    std::function<HRESULT()> call;
    HRESULT expected;
};

}  // namespace

TEST(HostileCaller, EveryMethodAnswersItsDocumentedCode) {
    Rig rig(44100, 4096);
    IBaseFilter* filter = rig.filter;
    IPin* in = rig.filter->GetPin(0);
    IPin* out = rig.filter->GetPin(1);
    ASSERT_TRUE(in && out);
    const auto memIn = Query<IMemInputPin>(in);
    const auto seeking = Query<IMediaSeeking>(out);
    const auto persist = rig.holder.As<IPersistStream>();
    const auto pages = rig.holder.As<ISpecifyPropertyPages>();
    const auto control = rig.holder.As<IReverbControl>();
    const auto presets = rig.holder.As<IHostPresets>();
    const auto info = rig.holder.As<IMediaParamInfo>();
    const auto params = rig.holder.As<IMediaParams>();
    ComRef<IEnumPins> pinEnum;
    ComRef<IEnumMediaTypes> inTypes, outTypes;
    ComRef<IClassFactory> factory;
    ASSERT_TRUE(memIn && seeking && persist && pages && control && presets && info && params);
    ASSERT_EQ(filter->EnumPins(pinEnum.put()), S_OK);
    ASSERT_EQ(in->EnumMediaTypes(inTypes.put()), S_OK);
    ASSERT_EQ(out->EnumMediaTypes(outTypes.put()), S_OK);
    const auto getClassObject = ModuleEntry<GetClassObject>("DllGetClassObject");
    const auto canUnloadNow = ModuleEntry<CanUnloadNow>("DllCanUnloadNow");
    ASSERT_TRUE(getClassObject && canUnloadNow);
    ASSERT_EQ(getClassObject(CLSID_UlvettaFilter, IID_IClassFactory, reinterpret_cast<void**>(factory.put())), S_OK);

    // Scratch results; whatever a call writes into them is released after the call.
    IPin* pin = nullptr;
    IUnknown* unknown = nullptr;
    AM_MEDIA_TYPE mt{}, *types[2] = {};
    ULONG fetched = 0;
    long processed = 0;
    WAVEFORMATEX wf{};
    WCHAR name[16] = {L'x'};
    WCHAR* text = nullptr;
    MP_PARAMINFO paramInfo{};
    MP_DATA value = 0;
    GUID guid{};
    MP_TIMEDATA timeData = 0;
    LONGLONG position = 0;
    MP_ENVELOPE_SEGMENT segment{0, 10000000, 0.0f, 1.0f, MP_CURVE_LINEAR, 0};
    const MP_DATA notANumber = NAN;
    const BYTE option = 1;
    ComRef<IStream> garbage = StreamOf(std::vector<uint8_t>(200, 0x5a));
    IMediaSample* samples[2] = {};
    auto sample = [&](long bytes) {
        ComRef<IMediaSample> s;
        if (FAILED(rig.source->GetBuffer(s.put(), nullptr, nullptr, 0))) return s;
        s->SetActualDataLength(bytes);
        return s;
    };

    const Call calls[] = {
        // IUnknown, IBaseFilter and its pin enumerator.
        {kFresh, "QueryInterface(null)", [&] { return filter->QueryInterface(IID_IBaseFilter, nullptr); }, E_POINTER},
        {kFresh, "QueryInterface(unknown IID)",
         [&] { return filter->QueryInterface(IID_IClassFactory, reinterpret_cast<void**>(&unknown)); }, E_NOINTERFACE},
        {kFresh, "GetClassID(null)", [&] { return filter->GetClassID(nullptr); }, E_POINTER},
        {kFresh, "GetState(null)", [&] { return filter->GetState(0, nullptr); }, E_POINTER},
        {kFresh, "GetSyncSource(null)", [&] { return filter->GetSyncSource(nullptr); }, E_POINTER},
        {kFresh, "SetSyncSource(null)", [&] { return filter->SetSyncSource(nullptr); }, S_OK},
        {kFresh, "EnumPins(null)", [&] { return filter->EnumPins(nullptr); }, E_POINTER},
        {kFresh, "FindPin(null id)", [&] { return filter->FindPin(nullptr, &pin); }, E_POINTER},
        {kFresh, "FindPin(null pin)", [&] { return filter->FindPin(L"In", nullptr); }, E_POINTER},
        {kFresh, "FindPin(unknown id)", [&] { return filter->FindPin(L"Sideways", &pin); }, VFW_E_NOT_FOUND},
        {kFresh, "QueryFilterInfo(null)", [&] { return filter->QueryFilterInfo(nullptr); }, E_POINTER},
        {kFresh, "QueryVendorInfo", [&] { return filter->QueryVendorInfo(&text); }, E_NOTIMPL},
        {kFresh, "IEnumPins::Next(null)", [&] { return pinEnum->Next(1, nullptr, &fetched); }, E_POINTER},
        {kFresh, "IEnumPins::Next(2, no count)", [&] { return pinEnum->Next(2, &pin, nullptr); }, E_INVALIDARG},
        {kFresh, "IEnumPins::Skip(past the end)", [&] { return pinEnum->Skip(3); }, S_FALSE},
        {kFresh, "IEnumPins::Clone(null)", [&] { return pinEnum->Clone(nullptr); }, E_POINTER},
        // Pins before any connection.
        {kFresh, "ConnectedTo(null)", [&] { return in->ConnectedTo(nullptr); }, E_POINTER},
        {kFresh, "ConnectedTo", [&] { return out->ConnectedTo(&pin); }, VFW_E_NOT_CONNECTED},
        {kFresh, "ConnectionMediaType(null)", [&] { return in->ConnectionMediaType(nullptr); }, E_POINTER},
        {kFresh, "ConnectionMediaType", [&] { return out->ConnectionMediaType(&mt); }, VFW_E_NOT_CONNECTED},
        {kFresh, "QueryPinInfo(null)", [&] { return out->QueryPinInfo(nullptr); }, E_POINTER},
        {kFresh, "QueryDirection(null)", [&] { return in->QueryDirection(nullptr); }, E_POINTER},
        {kFresh, "QueryId(null)", [&] { return out->QueryId(nullptr); }, E_POINTER},
        {kFresh, "QueryAccept(null)", [&] { return in->QueryAccept(nullptr); }, E_POINTER},
        {kFresh, "EnumMediaTypes(null)", [&] { return out->EnumMediaTypes(nullptr); }, E_POINTER},
        {kFresh, "Disconnect (not connected)", [&] { return in->Disconnect(); }, S_FALSE},
        {kFresh, "input Connect", [&] { return in->Connect(&rig.downstream, nullptr); }, E_UNEXPECTED},
        {kFresh, "output Connect(null)", [&] { return out->Connect(nullptr, nullptr); }, E_POINTER},
        {kFresh, "output Connect (input not connected)",
         [&] { return out->Connect(&rig.downstream, nullptr); }, VFW_E_NO_ACCEPTABLE_TYPES},
        {kFresh, "ReceiveConnection(null pin)", [&] { return in->ReceiveConnection(nullptr, rig.type); }, E_POINTER},
        {kFresh, "ReceiveConnection(null type)",
         [&] { return in->ReceiveConnection(&rig.upstream, nullptr); }, E_POINTER},
        {kFresh, "output ReceiveConnection",
         [&] { return out->ReceiveConnection(&rig.upstream, rig.type); }, E_UNEXPECTED},
        {kFresh, "EndOfStream (stopped)", [&] { return in->EndOfStream(); }, VFW_E_WRONG_STATE},
        {kFresh, "EndFlush (not connected)", [&] { return in->EndFlush(); }, VFW_E_NOT_CONNECTED},
        {kFresh, "BeginFlush (not connected)", [&] { return in->BeginFlush(); }, VFW_E_NOT_CONNECTED},
        {kFresh, "NewSegment (not connected)", [&] { return in->NewSegment(0, 1, 1.0); }, VFW_E_NOT_CONNECTED},
        {kFresh, "output EndOfStream", [&] { return out->EndOfStream(); }, E_UNEXPECTED},
        {kFresh, "output BeginFlush", [&] { return out->BeginFlush(); }, E_UNEXPECTED},
        {kFresh, "output EndFlush", [&] { return out->EndFlush(); }, E_UNEXPECTED},
        {kFresh, "IEnumMediaTypes::Next (input unconnected)",
         [&] { return outTypes->Next(1, types, &fetched); }, S_FALSE},
        {kFresh, "IEnumMediaTypes::Next(null)", [&] { return inTypes->Next(1, nullptr, &fetched); }, E_POINTER},
        {kFresh, "IEnumMediaTypes::Next(2, no count)", [&] { return inTypes->Next(2, types, nullptr); }, E_INVALIDARG},
        {kFresh, "IEnumMediaTypes::Skip (input unconnected)", [&] { return inTypes->Skip(1); }, S_FALSE},
        {kFresh, "IEnumMediaTypes::Clone(null)", [&] { return inTypes->Clone(nullptr); }, E_POINTER},
        {kFresh, "IMemInputPin::Receive(null)", [&] { return memIn->Receive(nullptr); }, E_POINTER},
        {kFresh, "ReceiveMultiple(null samples)",
         [&] { return memIn->ReceiveMultiple(nullptr, 1, &processed); }, E_POINTER},
        {kFresh, "ReceiveMultiple(null count)", [&] { return memIn->ReceiveMultiple(samples, 1, nullptr); }, E_POINTER},
        {kFresh, "GetAllocator(null)", [&] { return memIn->GetAllocator(nullptr); }, E_POINTER},
        {kFresh, "NotifyAllocator(null)", [&] { return memIn->NotifyAllocator(nullptr, FALSE); }, E_POINTER},
        {kFresh, "IMediaSeeking (input unconnected)",
         [&] { return seeking->GetDuration(&position); }, VFW_E_NOT_CONNECTED},
        // The filter's own interfaces.
        {kFresh, "IPersistStream::GetClassID(null)", [&] { return persist->GetClassID(nullptr); }, E_POINTER},
        {kFresh, "IPersistStream::Load(null)", [&] { return persist->Load(nullptr); }, E_POINTER},
        {kFresh, "IPersistStream::Save(null)", [&] { return persist->Save(nullptr, TRUE); }, E_POINTER},
        {kFresh, "IPersistStream::GetSizeMax(null)", [&] { return persist->GetSizeMax(nullptr); }, E_POINTER},
        {kFresh, "IPersistStream::Load(garbage)", [&] { return persist->Load(garbage.get()); }, E_UNEXPECTED},
        {kFresh, "GetPages(null)", [&] { return pages->GetPages(nullptr); }, E_POINTER},
        {kFresh, "GetOption(null)", [&] { return control->GetOption(nullptr); }, E_POINTER},
        {kFresh, "SetOption(null)", [&] { return control->SetOption(nullptr); }, E_POINTER},
        {kFresh, "GetFormat(null)", [&] { return control->GetFormat(nullptr, 0); }, E_POINTER},
        {kFresh, "GetFormat (no format yet)", [&] { return control->GetFormat(&wf, 0); }, VFW_E_NOT_CONNECTED},
        {kFresh, "GetFormat(direction -1)", [&] { return control->GetFormat(&wf, -1); }, VFW_E_NOT_CONNECTED},
        {kFresh, "GetPresetCount(null)", [&] { return presets->GetPresetCount(nullptr); }, E_POINTER},
        {kFresh, "GetPresetName(index 1)", [&] { return presets->GetPresetName(1, name, 16); }, E_INVALIDARG},
        {kFresh, "GetPresetName(null)", [&] { return presets->GetPresetName(0, nullptr, 16); }, E_POINTER},
        {kFresh, "GetPresetName(length 0)", [&] { return presets->GetPresetName(0, name, 0); }, S_OK},
        {kFresh, "GetPresetName(length -5)", [&] { return presets->GetPresetName(0, name, -5); }, S_OK},
        {kFresh, "SetPreset(index 1)", [&] { return presets->SetPreset(1); }, E_INVALIDARG},
        {kFresh, "GetParamCount(null)", [&] { return info->GetParamCount(nullptr); }, E_POINTER},
        {kFresh, "GetParamInfo(15)", [&] { return info->GetParamInfo(15, &paramInfo); }, E_INVALIDARG},
        {kFresh, "GetParamInfo(all)", [&] { return info->GetParamInfo(DWORD(-1), &paramInfo); }, E_INVALIDARG},
        {kFresh, "GetParamInfo(null)", [&] { return info->GetParamInfo(0, nullptr); }, E_POINTER},
        {kFresh, "GetParamText(15)", [&] { return info->GetParamText(15, &text); }, E_INVALIDARG},
        {kFresh, "GetParamText(null)", [&] { return info->GetParamText(0, nullptr); }, E_POINTER},
        {kFresh, "GetNumTimeFormats(null)", [&] { return info->GetNumTimeFormats(nullptr); }, E_POINTER},
        {kFresh, "GetSupportedTimeFormat(1)", [&] { return info->GetSupportedTimeFormat(1, &guid); }, E_INVALIDARG},
        {kFresh, "GetSupportedTimeFormat(null)", [&] { return info->GetSupportedTimeFormat(0, nullptr); }, E_POINTER},
        {kFresh, "GetCurrentTimeFormat(null format)",
         [&] { return info->GetCurrentTimeFormat(nullptr, &timeData); }, E_POINTER},
        {kFresh, "GetCurrentTimeFormat(null data)",
         [&] { return info->GetCurrentTimeFormat(&guid, nullptr); }, E_POINTER},
        {kFresh, "GetParam(15)", [&] { return params->GetParam(15, &value); }, E_INVALIDARG},
        {kFresh, "GetParam(all)", [&] { return params->GetParam(DWORD(-1), &value); }, E_INVALIDARG},
        {kFresh, "GetParam(null)", [&] { return params->GetParam(0, nullptr); }, E_POINTER},
        {kFresh, "SetParam(15)", [&] { return params->SetParam(15, 0.5f); }, E_INVALIDARG},
        {kFresh, "SetParam(NaN)", [&] { return params->SetParam(3, notANumber); }, S_OK},
        {kFresh, "AddEnvelope(15)", [&] { return params->AddEnvelope(15, 1, &segment); }, E_INVALIDARG},
        {kFresh, "AddEnvelope(null)", [&] { return params->AddEnvelope(0, 1, nullptr); }, E_POINTER},
        {kFresh, "AddEnvelope (no input rate yet)",
         [&] { return params->AddEnvelope(0, 1, &segment); }, VFW_E_NOT_CONNECTED},
        {kFresh, "FlushEnvelope(99) (no input rate yet)", [&] { return params->FlushEnvelope(99, 0, 1); }, S_OK},
        {kFresh, "SetCaptureCallback(null)", [&] { return rig.filter->SetCaptureCallback(nullptr); }, S_OK},
        // The class factory.
        {kFresh, "DllGetClassObject(unknown class)",
         [&] { return getClassObject(IID_IPin, IID_IClassFactory, reinterpret_cast<void**>(&unknown)); },
         CLASS_E_CLASSNOTAVAILABLE},
        {kFresh, "DllGetClassObject(null)",
         [&] { return getClassObject(CLSID_UlvettaFilter, IID_IClassFactory, nullptr); }, E_POINTER},
        {kFresh, "CreateInstance(null)",
         [&] { return factory->CreateInstance(nullptr, IID_IBaseFilter, nullptr); }, E_POINTER},
        {kFresh, "CreateInstance(aggregated, not IUnknown)",
         [&] { return factory->CreateInstance(filter, IID_IBaseFilter, reinterpret_cast<void**>(&unknown)); },
         E_NOINTERFACE},
        {kFresh, "LockServer(FALSE) unbalanced", [&] { return factory->LockServer(FALSE); }, S_OK},

        // Connected and paused, samples flowing.
        {kStreaming, "ReceiveConnection (already connected)",
         [&] { return in->ReceiveConnection(&rig.upstream, rig.type); }, VFW_E_ALREADY_CONNECTED},
        {kStreaming, "output Connect (already connected)",
         [&] { return out->Connect(&rig.downstream, nullptr); }, VFW_E_ALREADY_CONNECTED},
        {kStreaming, "input Disconnect (paused)", [&] { return in->Disconnect(); }, VFW_E_NOT_STOPPED},
        {kStreaming, "output Disconnect (paused)", [&] { return out->Disconnect(); }, VFW_E_NOT_STOPPED},
        {kStreaming, "GetFormat(direction 2)", [&] { return control->GetFormat(&wf, 2); }, VFW_E_NOT_CONNECTED},
        {kStreaming, "IMemInputPin::Receive(null)", [&] { return memIn->Receive(nullptr); }, E_POINTER},
        {kStreaming, "Receive(empty sample)", [&] { return memIn->Receive(sample(0).get()); }, S_OK},
        {kStreaming, "Receive(part of a frame)", [&] { return memIn->Receive(sample(3).get()); }, S_OK},
        {kStreaming, "ReceiveMultiple(a null sample)",
         [&] { return memIn->ReceiveMultiple(samples, 2, &processed); }, E_POINTER},
        {kStreaming, "ReceiveMultiple(count -1)",
         [&] { return memIn->ReceiveMultiple(samples, -1, &processed); }, S_OK},
        {kStreaming, "NotifyAllocator(null)", [&] { return memIn->NotifyAllocator(nullptr, FALSE); }, E_POINTER},
        {kStreaming, "IPersistStream::Load(garbage)", [&] { return persist->Load(garbage.get()); }, E_UNEXPECTED},
        {kStreaming, "SetOption", [&] { return control->SetOption(&option); }, S_OK},
        {kStreaming, "AddEnvelope(count 0)", [&] { return params->AddEnvelope(0, 0, &segment); }, S_OK},
        {kStreaming, "AddEnvelope(count -1)", [&] { return params->AddEnvelope(0, DWORD(-1), &segment); }, S_OK},
        {kStreaming, "AddEnvelope(all)", [&] { return params->AddEnvelope(DWORD(-1), 1, &segment); }, S_OK},
        {kStreaming, "FlushEnvelope(15)", [&] { return params->FlushEnvelope(15, 0, 1); }, E_INVALIDARG},
        {kStreaming, "FlushEnvelope(reversed times)",
         [&] { return params->FlushEnvelope(DWORD(-1), 1000, -1000); }, S_OK},
        {kStreaming, "IMediaSeeking (upstream cannot seek)",
         [&] { return seeking->GetDuration(&position); }, E_NOTIMPL},
        {kStreaming, "EndOfStream", [&] { return in->EndOfStream(); }, S_OK},
        {kStreaming, "Receive after EndOfStream",
         [&] { return memIn->Receive(sample(4).get()); }, VFW_E_SAMPLE_REJECTED_EOS},
        {kStreaming, "IEnumMediaTypes::Skip(past the end)",
         [&] { return outTypes->Reset(), outTypes->Skip(2); }, S_FALSE},
        {kStreaming, "Pause again", [&] { return filter->Pause(); }, S_OK},

        // Stopped, both pins disconnected.
        {kDisconnected, "Receive (stopped)", [&] { return memIn->Receive(sample(4).get()); }, VFW_E_WRONG_STATE},
        {kDisconnected, "EndOfStream (stopped)", [&] { return in->EndOfStream(); }, VFW_E_WRONG_STATE},
        {kDisconnected, "ConnectedTo", [&] { return in->ConnectedTo(&pin); }, VFW_E_NOT_CONNECTED},
        {kDisconnected, "Disconnect again", [&] { return out->Disconnect(); }, S_FALSE},
        {kDisconnected, "GetMediaType", [&] { return rig.filter->GetMediaType(0, &mt); }, E_UNEXPECTED},
        {kDisconnected, "IEnumMediaTypes::Next", [&] { return outTypes->Next(1, types, &fetched); }, S_FALSE},
        {kDisconnected, "IMediaSeeking", [&] { return seeking->GetDuration(&position); }, VFW_E_NOT_CONNECTED},
        {kDisconnected, "Pause (nothing connected)", [&] { return filter->Pause(); }, S_OK},
        {kDisconnected, "Stop", [&] { return filter->Stop(); }, S_OK},
    };

    auto release = [&] {
        if (pin) pin->Release(), pin = nullptr;
        if (unknown) unknown->Release(), unknown = nullptr;
        if (text) CoTaskMemFree(text), text = nullptr;
        for (AM_MEDIA_TYPE*& t : types)
            if (t) DeleteMediaType(t), t = nullptr;
        FreeMediaType(mt);
        std::memset(&mt, 0, sizeof mt);
    };
    for (Phase phase : {kFresh, kStreaming, kDisconnected}) {
        if (phase == kStreaming) {
            ASSERT_EQ(rig.Connect(), S_OK);
        } else if (phase == kDisconnected) {
            ASSERT_EQ(filter->Stop(), S_OK);
            ASSERT_EQ(out->Disconnect(), S_OK);
            ASSERT_EQ(in->Disconnect(), S_OK);
        }
        int count = 0;
        for (const Call& c : calls) {
            if (c.phase != phase) continue;
            ++count;
            EXPECT_EQ(c.call(), c.expected) << kPhaseNames[phase] << ": " << c.what;
            release();
        }
        EXPECT_GT(count, 0);
    }
    factory.reset();
    EXPECT_EQ(canUnloadNow(), S_OK) << "an unbalanced LockServer(FALSE) must not leave the module locked";
}
