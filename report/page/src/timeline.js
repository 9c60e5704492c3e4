// The events over time: stacked bars by severity, the reproduction interval marked, zoom, and a click that chooses a
// time.
import {BarChart} from 'echarts/charts';
import {
  AriaComponent,
  DataZoomInsideComponent,
  DataZoomSliderComponent,
  GridComponent,
  MarkAreaComponent,
  TooltipComponent,
} from 'echarts/components';
import {init, use} from 'echarts/core';
import {CanvasRenderer} from 'echarts/renderers';
import {binWidth, countBins, readEvents} from './histogram.js';
import {colours} from './theme.js';
import {element} from './dom.js';
import {formatTime, plural} from './format.js';
import {kSeverities} from './severity.js';

use([
  BarChart,
  CanvasRenderer,
  GridComponent,
  TooltipComponent,
  DataZoomInsideComponent,
  DataZoomSliderComponent,
  MarkAreaComponent,
  AriaComponent,
]);

const kNarrowestView = 20000; // milliseconds
const kDrawn = ['text', 'quiet', 'line', 'accent', 'interval', ...kSeverities, 'information-fill'];

const kTimeLabels = {
  year: '{yyyy}',
  month: '{yyyy}-{MM}',
  day: '{MM}-{dd}',
  hour: '{HH}:{mm}',
  minute: '{HH}:{mm}',
  second: '{HH}:{mm}:{ss}',
};

export class Timeline {
  #events;
  #interval;
  #chart;
  #view; // {from, to}: what is in view
  #bins;
  #legend = element('ul', {class: 'legend', 'aria-label': 'Events in view by severity'});
  #range = element('p', {class: 'range', 'aria-live': 'polite'});
  #canvas = element('div', {class: 'chart'});

  // `onSelect(from, to)` is called with the time that was chosen; `to` is not part of it.
  constructor({table, time, severity, interval}, onSelect) {
    this.#events = readEvents(table.rows, time, severity);
    this.#interval = interval;
    this.element = element('div', {class: 'timeline'});
    if (!this.#events) {
      this.element.append(element('p', {class: 'quiet'}, 'No event has a time.'));
      return;
    }
    this.#view = this.#whole();
    this.element.append(
      this.#buttons(onSelect),
      this.#canvas,
      element(
        'div',
        {class: 'below'},
        this.#legend,
        element(
          'p',
          {class: 'hint quiet'},
          'A click shows the events of that time. Ctrl and wheel, or the slider, zoom.',
        ),
      ),
    );
    this.onSelect = onSelect;
  }

  // Moves the chart to a place of the page; it is made when it is seen for the first time.
  showIn(host) {
    host.append(this.element);
    if (!this.#events) return;
    if (this.#chart) this.redraw();
    else this.#start();
  }

  // After the colours or the width have changed.
  redraw() {
    if (!this.#chart || this.#canvas.offsetWidth === 0) return;
    this.#chart.resize();
    this.#draw();
  }

  zoomTo(from, to) {
    const whole = this.#whole();
    const width = Math.min(Math.max(to - from, kNarrowestView), whole.to - whole.from);
    const start = Math.min(Math.max(from, whole.from), whole.to - width);
    this.#view = {from: start, to: start + width};
    this.#draw();
  }

  #start() {
    this.#chart = init(this.#canvas, null, {renderer: 'canvas'});
    this.#draw();
    this.#chart.on('datazoom', () => {
      const [{startValue, endValue}] = this.#chart.getOption().dataZoom;
      if (!Number.isFinite(startValue) || !(endValue > startValue)) return;
      this.#view = {from: startValue, to: endValue};
      this.#drawBins();
    });
    this.#chart.getZr().on('click', ({offsetX, offsetY}) => {
      if (!this.#chart.containPixel('grid', [offsetX, offsetY])) return;
      const [time] = this.#chart.convertFromPixel('grid', [offsetX, offsetY]);
      const from =
        Math.floor((time - this.#bins.starts[0]) / this.#bins.width) * this.#bins.width + this.#bins.starts[0];
      this.onSelect(from, from + this.#bins.width);
    });
    new ResizeObserver(() => {
      if (this.#canvas.offsetWidth > 0) this.#chart.resize();
    }).observe(this.#canvas);
  }

  // Of the events and of the reproduction, with some room.
  #whole() {
    const from = Math.min(this.#events.from, this.#interval?.from ?? Infinity);
    const to = Math.max(this.#events.to, this.#interval?.to ?? -Infinity);
    const width = binWidth(from, to + kNarrowestView);
    return {from: from - width, to: Math.max(to + width, from + kNarrowestView)};
  }

  #buttons(onSelect) {
    const button = (label, act) => element('button', {type: 'button', onclick: act}, label);
    const zoom = (factor) => {
      const {from, to} = this.#view;
      const [middle, half] = [(from + to) / 2, ((to - from) / 2) * factor];
      this.zoomTo(middle - half, middle + half);
    };
    const move = (part) =>
      this.zoomTo(
        this.#view.from + (this.#view.to - this.#view.from) * part,
        this.#view.to + (this.#view.to - this.#view.from) * part,
      );
    const interval =
      this.#interval &&
      button('Reproduction', () => {
        const room = (this.#interval.to - this.#interval.from) * 0.25;
        this.zoomTo(this.#interval.from - room, this.#interval.to + room);
      });
    return element(
      'div',
      {class: 'toolbar', role: 'group', 'aria-label': 'Time in view'},
      button('Earlier', () => move(-0.5)),
      button('Later', () => move(0.5)),
      button('Zoom in', () => zoom(0.5)),
      button('Zoom out', () => zoom(2)),
      button('All', () => {
        const {from, to} = this.#whole();
        this.zoomTo(from, to);
      }),
      interval,
      button('Show these events', () => onSelect(this.#view.from, this.#view.to)),
      this.#range,
    );
  }

  #draw() {
    const colour = colours(kDrawn);
    const {from, to} = this.#whole();
    const font = getComputedStyle(document.body).fontFamily;
    this.#chart.setOption({
      animation: false,
      useUTC: true,
      textStyle: {fontFamily: font, color: colour.text},
      aria: {enabled: true, label: {description: 'Events over time by severity. The list below holds the counts.'}},
      grid: {left: 46, right: 44, top: 22, bottom: 58},
      tooltip: {
        trigger: 'axis',
        renderMode: 'richText',
        axisPointer: {type: 'shadow', snap: true},
        formatter: (series) => this.#tip(series),
      },
      xAxis: {
        type: 'time',
        min: from,
        max: to,
        axisLabel: {color: colour.quiet, hideOverlap: true, formatter: kTimeLabels},
        axisLine: {lineStyle: {color: colour.line}},
        splitLine: {show: false},
      },
      yAxis: {
        type: 'value',
        minInterval: 1,
        axisLabel: {color: colour.quiet},
        splitLine: {lineStyle: {color: colour.line}},
      },
      dataZoom: [
        {
          type: 'inside',
          zoomOnMouseWheel: 'ctrl',
          filterMode: 'none',
          startValue: this.#view.from,
          endValue: this.#view.to,
          minValueSpan: kNarrowestView,
        },
        {
          type: 'slider',
          filterMode: 'none',
          startValue: this.#view.from,
          endValue: this.#view.to,
          minValueSpan: kNarrowestView,
          height: 18,
          bottom: 8,
          showDataShadow: false,
          brushSelect: true,
          moveHandleSize: 4,
          borderColor: colour.line,
          fillerColor: colour.interval,
          labelFormatter: formatTime,
          textStyle: {color: colour.quiet},
        },
      ],
    });
    this.#drawBins(colour);
  }

  #drawBins(colour = colours(kDrawn)) {
    this.#bins = countBins(this.#events, this.#view.from, this.#view.to);
    const {starts, width, counts} = this.#bins;
    const series = kSeverities
      .map((name, at) => ({
        name,
        type: 'bar',
        stack: 'events',
        barCategoryGap: '12%',
        itemStyle: {color: colour[`${name}-fill`] ?? colour[name]},
        cursor: 'pointer',
        large: false,
        data: starts.map((start, bin) => [start + width / 2, counts[at][bin]]),
      }))
      .reverse();
    if (this.#interval) {
      series[0].markArea = {
        silent: true,
        itemStyle: {color: colour.interval, borderColor: colour.accent, borderWidth: 1},
        label: {color: colour.accent, position: 'top', distance: 3},
        data: [[{name: 'Reproduction', xAxis: this.#interval.from}, {xAxis: this.#interval.to}]],
      };
    }
    this.#chart.setOption({series});
    this.#describe();
  }

  #describe() {
    const totals = this.#bins.counts.map((bins) => bins.reduce((sum, count) => sum + count, 0));
    this.#legend.replaceChildren(
      ...kSeverities.flatMap((name, at) =>
        totals[at] === 0
          ? []
          : element('li', {class: `severity ${name}`}, `${name}: ${totals[at].toLocaleString('en')}`),
      ),
    );
    this.#range.textContent = `${formatTime(this.#view.from)} to ${formatTime(this.#view.to)}`;
  }

  #tip(series) {
    const bin = series[0].dataIndex;
    const lines = series
      .filter(({value}) => value[1] > 0)
      .map(({seriesName, value}) => `${seriesName}: ${value[1].toLocaleString('en')}`)
      .reverse();
    return [formatTime(this.#bins.starts[bin]), ...(lines.length > 0 ? lines : [plural(0, 'event')])].join('\n');
  }
}
