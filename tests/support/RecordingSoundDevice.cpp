#include "support/RecordingSoundDevice.h"

#include <algorithm>
#include <cstring>

namespace oxtest {

using Lock = std::lock_guard<std::mutex>;
using ox::sound::SourceState;

double RecordingSoundDevice::Buffer::Seconds() const
{
    return rate > 0 ? static_cast<double>(pcm.size()) / (stereo ? 2 : 1) / rate : 0.0;
}

bool RecordingSoundDevice::Open()
{
    Lock lock(m_Lock);
    m_Open = openResult;
    return m_Open;
}

void RecordingSoundDevice::Close()
{
    Lock lock(m_Lock);
    m_Open = false;
}

bool RecordingSoundDevice::IsOpen() const
{
    Lock lock(m_Lock);
    return m_Open;
}

RecordingSoundDevice::Source* RecordingSoundDevice::Find(SoundName source)
{
    auto it = m_Sources.find(source);
    if (it == m_Sources.end()) {
        ++errors;
        return nullptr;
    }
    return &it->second;
}

ox::sound::SoundName RecordingSoundDevice::CreateSource()
{
    Lock lock(m_Lock);
    m_Sources[m_Next] = Source();
    return m_Next++;
}

void RecordingSoundDevice::DeleteSource(SoundName source)
{
    Lock lock(m_Lock);
    if (!m_Sources.erase(source))
        ++errors;
}

ox::sound::SoundName RecordingSoundDevice::CreateBuffer()
{
    Lock lock(m_Lock);
    m_Buffers[m_Next] = Buffer();
    return m_Next++;
}

void RecordingSoundDevice::DeleteBuffer(SoundName buffer)
{
    Lock lock(m_Lock);
    if (!m_Buffers.erase(buffer))
        ++errors;
}

void RecordingSoundDevice::BufferData(SoundName buffer, bool stereo, const void* data, unsigned size, int rate)
{
    Lock lock(m_Lock);
    auto it = m_Buffers.find(buffer);
    bool queued = std::any_of(m_Sources.begin(), m_Sources.end(), [&](const auto& s) {
        return std::find(s.second.queue.begin(), s.second.queue.end(), buffer) != s.second.queue.end();
    });
    if (it == m_Buffers.end() || queued || size % 2) {
        ++errors;
        return;
    }
    it->second.pcm.resize(size / 2);
    memcpy(it->second.pcm.data(), data, size);
    it->second.stereo = stereo;
    it->second.rate = rate;
}

void RecordingSoundDevice::QueueBuffer(SoundName source, SoundName buffer)
{
    Lock lock(m_Lock);
    Source* s = Find(source);
    if (!s || !m_Buffers.count(buffer)) {
        ++errors;
        return;
    }
    s->queue.push_back(buffer);
}

void RecordingSoundDevice::UnqueueBuffers(SoundName source, unsigned count, SoundName* buffers)
{
    Lock lock(m_Lock);
    Source* s = Find(source);
    if (!s || count > s->processed) {
        ++errors;
        return;
    }
    for (unsigned i = 0; i < count; ++i) {
        buffers[i] = s->queue.front();
        s->queue.pop_front();
    }
    s->processed -= count;
}

void RecordingSoundDevice::Play(SoundName source)
{
    Lock lock(m_Lock);
    Source* s = Find(source);
    if (!s)
        return;
    ++s->plays;
    if (s->state == SourceState::Playing)
        return;
    if (s->state != SourceState::Paused) {
        // From the front of the queue again.
        s->processed = 0;
        s->position = 0.0;
    }
    s->state = s->processed < s->queue.size() ? SourceState::Playing : SourceState::Stopped;
}

void RecordingSoundDevice::Pause(SoundName source)
{
    Lock lock(m_Lock);
    Source* s = Find(source);
    if (s && s->state == SourceState::Playing)
        s->state = SourceState::Paused;
}

void RecordingSoundDevice::Stop(SoundName source)
{
    Lock lock(m_Lock);
    Source* s = Find(source);
    if (!s)
        return;
    s->state = SourceState::Stopped;
    s->processed = s->queue.size();
    s->position = 0.0;
}

void RecordingSoundDevice::SetGain(SoundName source, float gain)
{
    Lock lock(m_Lock);
    if (Source* s = Find(source))
        s->gain = gain;
}

unsigned RecordingSoundDevice::GetProcessed(SoundName source)
{
    Lock lock(m_Lock);
    Source* s = Find(source);
    return s ? static_cast<unsigned>(s->processed) : 0;
}

unsigned RecordingSoundDevice::GetQueued(SoundName source)
{
    Lock lock(m_Lock);
    Source* s = Find(source);
    return s ? static_cast<unsigned>(s->queue.size()) : 0;
}

ox::sound::SourceState RecordingSoundDevice::GetState(SoundName source)
{
    Lock lock(m_Lock);
    Source* s = Find(source);
    return s ? s->state : SourceState::Initial;
}

double RecordingSoundDevice::GetSecOffset(SoundName source)
{
    Lock lock(m_Lock);
    Source* s = Find(source);
    if (!s || s->state == SourceState::Stopped || s->state == SourceState::Initial)
        return 0.0;
    double offset = s->position;
    for (size_t i = 0; i < s->processed; ++i)
        offset += m_Buffers[s->queue[i]].Seconds();
    return offset;
}

unsigned RecordingSoundDevice::GetBufferSize(SoundName buffer)
{
    Lock lock(m_Lock);
    auto it = m_Buffers.find(buffer);
    return it == m_Buffers.end() ? 0 : static_cast<unsigned>(it->second.pcm.size() * 2);
}

void RecordingSoundDevice::Advance(double ms)
{
    Lock lock(m_Lock);
    for (auto& [name, s] : m_Sources) {
        if (s.state != SourceState::Playing)
            continue;
        double left = ms / 1000.0;
        while (left > 0.0 && s.processed < s.queue.size()) {
            const double rest = m_Buffers[s.queue[s.processed]].Seconds() - s.position;
            const double step = std::min(left, rest);
            s.position += step;
            s.playedSeconds += step;
            left -= step;
            if (step >= rest) {
                ++s.processed;
                s.position = 0.0;
            }
        }
        if (s.processed == s.queue.size())
            s.state = SourceState::Stopped;
    }
}

RecordingSoundDevice::Source RecordingSoundDevice::GetSource(SoundName source)
{
    Lock lock(m_Lock);
    auto it = m_Sources.find(source);
    return it == m_Sources.end() ? Source() : it->second;
}

size_t RecordingSoundDevice::LiveBuffers()
{
    Lock lock(m_Lock);
    return m_Buffers.size();
}

size_t RecordingSoundDevice::LiveSources()
{
    Lock lock(m_Lock);
    return m_Sources.size();
}

size_t RecordingSoundDevice::PlayingSources()
{
    Lock lock(m_Lock);
    return std::count_if(m_Sources.begin(), m_Sources.end(),
                         [](const auto& s) { return s.second.state == SourceState::Playing; });
}

bool RecordingSoundDevice::IsBuffer(SoundName buffer)
{
    Lock lock(m_Lock);
    return m_Buffers.count(buffer) != 0;
}

} // namespace oxtest
