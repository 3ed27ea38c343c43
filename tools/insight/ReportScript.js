// The replay report's plots, drawn with the inlined dygraphs library: step lines over trace time
// in seconds, the value under the pointer in the legend line, drag to zoom into a stretch of the
// trace (every plot follows), double-click to zoom out. Spans of scenes, on/off commands and timed
// actions are shaded behind the lines.
var velmoraReport = (function () {
  var graphs = [];
  var following = false;

  function number(v) {
    return Math.abs(v) >= 100 ? v.toFixed(0) : String(Math.round(v * 1000) / 1000);
  }

  function shade(canvas, area, g) {
    report.spans.forEach(function (span) {
      var left = g.toDomXCoord(span[0]);
      var right = g.toDomXCoord(span[1]);
      canvas.fillStyle = span[2];
      canvas.fillRect(left, area.y, Math.max(1, right - left), area.h);
    });
  }

  function follow(source, from, to) {
    if (following) return;
    following = true;
    graphs.forEach(function (g) {
      if (g !== source) g.updateOptions({dateWindow: [from, to]});
    });
    following = false;
  }

  var report = {
    // [begin s, end s, fill, name] of every shaded span.
    spans: [],
    graphs: graphs,
    plot: function (index, p, rows) {
      var g = new Dygraph(document.getElementById('plot' + index), rows, {
        labels: ['trace time'].concat(p.labels),
        colors: p.colors,
        stepPlot: true,
        strokeWidth: 2,
        highlightCircleSize: 3,
        valueRange: p.range,
        xlabel: 'trace time (s)',
        ylabel: p.unit,
        xLabelHeight: 14,
        yLabelWidth: 14,
        legend: 'always',
        labelsDiv: document.getElementById('legend' + index),
        axes: {
          x: {
            valueFormatter: function (v) { return v.toFixed(3) + ' s'; },
            axisLabelFormatter: function (v) { return number(v) + ' s'; }
          },
          y: {
            valueFormatter: function (v) { return number(v) + ' ' + p.unit; },
            axisLabelFormatter: number,
            axisLabelWidth: 56
          }
        },
        underlayCallback: shade,
        zoomCallback: function (from, to) { follow(g, from, to); }
      });
      graphs.push(g);
    }
  };
  return report;
})();

// Measures the plots once the page is laid out and leaves the figures in the body's data-plots
// attribute, for the browser check of the test suite: place, size, series, colours, axis ticks.
window.addEventListener('load', function () {
  var out = velmoraReport.graphs.map(function (g) {
    var div = g.maindiv_;
    var r = div.getBoundingClientRect();
    var colours = {};
    g.getColors().forEach(function (c) { colours[c] = true; });
    return {
      x: r.left + window.scrollX, y: r.top + window.scrollY, w: r.width, h: r.height,
      series: g.numColumns() - 1, rows: g.numRows(), colours: Object.keys(colours).length,
      xticks: div.querySelectorAll('.dygraph-axis-label-x').length,
      ylabel: (div.querySelector('.dygraph-ylabel') || {}).textContent || ''
    };
  });
  document.body.setAttribute('data-plots', JSON.stringify(out));
});
